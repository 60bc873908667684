#include "hints_machine.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <chrono>

namespace vlm::test {

namespace fs = std::filesystem;

namespace {

PrivateBus::Options sessionBusOptions() {
    PrivateBus::Options options;
    options.type = "session";
    return options;
}

PrivateBus::Options systemBusOptions(const fs::path& serviceFolder) {
    auto options = PrivateBus::underPolicy(VLM_BUS_POLICY);
    fs::create_directory(serviceFolder);
    options.serviceFolders = {serviceFolder};
    return options;
}

// The text between the first `left` and the next `right`; nothing when there is none.
std::string between(const std::string& text, const std::string& left, const std::string& right) {
    const auto begin = text.find(left);
    if (begin == std::string::npos) return {};
    const auto end = text.find(right, begin + left.size());
    return text.substr(begin + left.size(), end - begin - left.size());
}

}  // namespace

// The build tree may lie where only its owner gets in, and some tests run its programs as another
// user.
HintsMachine::HintsMachine()
    : _systemBus(systemBusOptions(_folder.path() / "services")), _sessionBus(sessionBusOptions()) {
    for (const char* program : {VLM_HINTS_SERVICE, VLM_HINTS_CALL})
        fs::copy_file(program, _folder.path() / fs::path(program).filename());
    fs::create_directory(commonFolder());
    chmod(commonFolder().c_str(), 01777);
}

void HintsMachine::insertCard(const std::string& name) {
    _cards.add("Card", {identity("p256", name)});
    if (!_daemon && !_isDaemonStartable) return;
    const auto list = call({"op=1", "uid=-1"});
    _hash = between(list, "<", ">");
    _token = between(list, "\"pkcs11:", "\"");
    ASSERT_EQ(_hash.size(), 64u) << list;
    ASSERT_FALSE(_token.empty()) << list;
    _token.insert(0, "pkcs11:");
}

std::vector<std::string> HintsMachine::daemonCommand(std::vector<std::string> moreArguments) const {
    std::vector<std::string> command{
        _folder.path() / "vlmhintsd", "--system", "--worker", VLM_TOKEN_WORKER, "--modules",
        _cards.moduleDirectory()};
    std::ranges::move(moreArguments, std::back_inserter(command));
    if (std::ranges::find(command, "--database") == command.end()) {
        command.push_back("--database");
        command.push_back(_folder.path() / "state" / "hints.sqlite3");
    }
    return command;
}

void HintsMachine::startDaemon(std::vector<std::string> moreArguments) {
    _daemon = std::make_unique<Child>(daemonCommand(std::move(moreArguments)), options());
    waitForName(*_daemon, _systemBus, kDaemon);
}

void HintsMachine::makeDaemonStartable(const std::vector<std::string>& moreArguments) {
    std::string command = "/usr/bin/env";
    for (const auto& [name, value] : options().environment)
        if (value) command += " " + name + "=" + *value;
    for (const auto& argument : daemonCommand(moreArguments)) command += " " + argument;
    _folder.write(
        std::string("services/") + kDaemon + ".service",
        std::string("[D-BUS Service]\nName=") + kDaemon + "\nUser=root\nExec=" + command + "\n");
    _isDaemonStartable = true;
}

void HintsMachine::startAgent(std::optional<uid_t> user, std::vector<std::string> moreArguments) {
    std::vector<std::string> command{_folder.path() / "vlmhintsd", "--user"};
    std::ranges::move(moreArguments, std::back_inserter(command));
    _agent = std::make_unique<Child>(command, options(user));
    waitForName(*_agent, _sessionBus, kAgent);
}

std::vector<std::string> HintsMachine::callCommand(
    const std::string& name, const std::vector<std::string>& arguments) const {
    std::vector<std::string> command{_folder.path() / "hints_call",
                                     name == kDaemon ? "system" : "session", name};
    std::ranges::copy(arguments, std::back_inserter(command));
    return command;
}

std::string HintsMachine::call(const std::vector<std::string>& arguments,
                               std::optional<uid_t> user) const {
    return callOn(kDaemon, arguments, user);
}

std::string HintsMachine::callAgent(const std::vector<std::string>& arguments,
                                    std::optional<uid_t> user) const {
    return callOn(kAgent, arguments, user);
}

std::string HintsMachine::callOn(const std::string& name, const std::vector<std::string>& arguments,
                                 std::optional<uid_t> user) const {
    const auto ended = run(callCommand(name, arguments), options(user));
    if (ended.status != 0) return "(the call ended badly) " + ended.errors;
    return ended.output;
}

std::vector<std::string> HintsMachine::login(const std::vector<std::string>& more) const {
    std::vector<std::string> arguments{"op=0", "dat1=" + _hash, "str1=" + _token, "uid=-1"};
    std::ranges::copy(more, std::back_inserter(arguments));
    return arguments;
}

std::vector<std::string> HintsMachine::pair(const std::string& account) const {
    return {"op=2", "dat1=" + _hash, "str1=" + account};
}

std::string HintsMachine::pinentry(const std::string& script) const {
    const auto path = _folder.write("pinentry", "#!/bin/sh\n" + script);
    chmod(path.c_str(), 0755);
    return path;
}

std::string HintsMachine::answeringPinentry() const {
    return pinentry(
        "echo OK\n"
        "while read -r line; do\n"
        "  case $line in GETPIN) echo 'D 123456' ;; BYE) echo OK; exit ;; esac\n"
        "  echo OK\n"
        "done\n");
}

Child::Options HintsMachine::options(std::optional<uid_t> user) const {
    Child::Options options;
    options.user = user;
    options.environment = {{"DBUS_SYSTEM_BUS_ADDRESS", _systemBus.address()},
                           {"DBUS_SESSION_BUS_ADDRESS", _sessionBus.address()},
                           // The readers of the machine that runs the test are no part of it.
                           {"PCSCLITE_CSOCK_NAME", _folder.path() / "pcscd.comm"},
                           {"VLM_LOG_TARGET", "stderr"},
                           {"DISPLAY", std::nullopt},
                           {"WAYLAND_DISPLAY", std::nullopt}};
    options.environment.merge(_cards.environment());
    return options;
}

void HintsMachine::waitForName(Child& instance, const PrivateBus& bus, const std::string& name) {
    const bool isUp = eventually(
        [&] { return instance.wait(std::chrono::milliseconds(0)) || bus.hasOwner(name); });
    ASSERT_TRUE(isUp) << name << " is not on the bus";
    ASSERT_FALSE(instance.wait(std::chrono::milliseconds(0))) << instance.errors();
}

}  // namespace vlm::test
