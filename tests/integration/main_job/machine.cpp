#include "machine.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>

namespace vlm::test {

// The build tree may lie where only its owner gets in; its programs find their library and their
// files relative to themselves.
Machine::Machine() : _bus(PrivateBus::underPolicy(VLM_BUS_POLICY)) {
    const std::filesystem::path from = VLM_BUILD_TREE;
    const auto to = _folder.path() / "tree";
    std::filesystem::create_directories(to / "bin");
    std::filesystem::create_directories(to / "lib");
    for (const char* program : {"vlmbind", "vlmhintsd", "vlm-token-worker"})
        std::filesystem::copy(from / "bin" / program, to / "bin" / program);
    for (const auto& file : std::filesystem::directory_iterator(from / "lib"))
        if (file.path().filename().string().starts_with("libvlm.so"))
            std::filesystem::copy(file, to / "lib" / file.path().filename(),
                                  std::filesystem::copy_options::copy_symlinks);
    std::filesystem::copy(from / "share", to / "share", std::filesystem::copy_options::recursive);
}

Child::Environment Machine::environment() const {
    Child::Environment variables{{"DBUS_SYSTEM_BUS_ADDRESS", _bus.address()},
                                 {"DBUS_SESSION_BUS_ADDRESS", std::nullopt},
                                 {"LANGUAGE", std::nullopt},
                                 {"LC_ALL", "C"},
                                 {"VLM_LOG_TARGET", "none"},
                                 {"VLM_LOG_LEVEL", std::nullopt}};
    variables.merge(cards.environment());
    return variables;
}

void Machine::startService(const std::string& typedPin) {
    Child::Options options{environment(), std::nullopt};
    options.environment["VLM_DEMO_PIN"] = typedPin;
    options.environment["VLM_LOG_TARGET"] = "stderr";
    _service = std::make_unique<Child>(
        std::vector<std::string>{_folder.path() / "tree" / "bin" / "vlmhintsd", "--system",
                                 "--database", _folder.path() / "state" / "hints.sqlite3",
                                 "--modules", cards.moduleDirectory(), "--pinentry",
                                 VLM_ANSWERING_PINENTRY},
        options);
    ASSERT_TRUE(eventually([this] { return _bus.hasOwner("org.vlm.token.hints.daemon"); }))
        << _service->errors();
}

void Machine::stopService() {
    _service->signal(SIGTERM);
    EXPECT_EQ(_service->wait(), 0) << _service->errors();
}

Ended Machine::vlmbind(std::vector<std::string> arguments, std::optional<uid_t> user,
                       Child::Environment variables) {
    arguments.insert(arguments.begin(), tool());
    return run(std::move(arguments), user, std::move(variables));
}

Ended Machine::run(std::vector<std::string> command, std::optional<uid_t> user,
                   Child::Environment variables) {
    Child::Options options{environment(), user};
    options.environment["HOME"] = homeOf(user);
    options.environment["XDG_CACHE_HOME"] = std::nullopt;
    options.environment["XDG_CONFIG_HOME"] = std::nullopt;
    options.environment["XDG_RUNTIME_DIR"] = std::nullopt;
    // The confinement keeps the leak checker from looking at its own process.
    options.environment["ASAN_OPTIONS"] = "detect_leaks=0";
    for (auto& [name, value] : variables) options.environment[name] = value;

    return test::run(std::move(command), options);
}

// Each user has one of their own, where the tool makes its private folders.
std::filesystem::path Machine::homeOf(std::optional<uid_t> user) const {
    auto home = _folder.path() / ("home-" + std::to_string(user.value_or(getuid())));
    std::filesystem::create_directories(home);
    if (user) {
        EXPECT_EQ(chown(home.c_str(), *user, *user), 0);
    }
    return home;
}

std::string Machine::listingOnceItShows(const std::string& text) {
    std::string listing;
    eventually([&] {
        listing = vlmbind({"-i"}).output;
        return text.empty() ? listing.empty() : listing.find(text) != std::string::npos;
    });
    return listing;
}

const std::string& Machine::serviceLog() { return _service->errors(); }

}  // namespace vlm::test
