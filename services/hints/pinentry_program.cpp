#include "services/hints/pinentry_program.h"

#include <pwd.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <string_view>

namespace vlm::service {

namespace {

constexpr std::array kFolders = {"/usr/local/bin", "/usr/bin", "/bin"};

// What leads to a desktop. A prompt of the daemon's never goes to one that the daemon happened to
// be started from.
constexpr std::array<std::string_view, 6> kDesktop = {
    "DISPLAY=",    "WAYLAND_DISPLAY=", "DBUS_SESSION_BUS_ADDRESS=",
    "XAUTHORITY=", "XDG_RUNTIME_DIR=", "GPG_TTY="};

std::vector<std::string> ownEnvironment() {
    std::vector<std::string> environment;
    for (char** entry = environ; *entry; ++entry) environment.emplace_back(*entry);
    return environment;
}

bool leadsToDesktop(const std::string& entry) {
    return std::ranges::any_of(kDesktop, [&](auto name) { return entry.starts_with(name); });
}

// A user without an account has the group of nobody in particular.
gid_t groupOf(uid_t user) {
    std::array<char, 16384> room = {};
    passwd account = {};
    passwd* found = nullptr;
    constexpr gid_t kNoGroup = 65534;
    if (getpwuid_r(user, &account, room.data(), room.size(), &found) != 0 || !found)
        return kNoGroup;
    return account.pw_gid;
}

}  // namespace

std::string pinentryPath(const std::string& named) {
    if (!named.empty()) return named;
    for (const auto* folder : kFolders) {
        auto path = std::string(folder) + "/pinentry";
        if (access(path.c_str(), X_OK) == 0) return path;
    }
    return "/usr/bin/pinentry";
}

ProgramToRun pinentryFor(const Caller& caller, const std::string& named) {
    ProgramToRun program{pinentryPath(named), {}, std::nullopt, 0};
    if (caller.isRoot()) {
        program.environment = ownEnvironment();
        std::erase_if(program.environment, leadsToDesktop);
    } else {
        program.environment = {"PATH=/usr/local/bin:/usr/bin:/bin", "LANG=C.UTF-8"};
        program.user = caller.user;
        program.group = groupOf(caller.user);
    }
    return program;
}

ProgramToRun pinentryOnDesktop(const std::string& named) {
    return {pinentryPath(named), ownEnvironment(), std::nullopt, 0};
}

}  // namespace vlm::service
