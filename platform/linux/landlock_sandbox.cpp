#include "platform/linux/landlock_sandbox.h"

#include <fcntl.h>
#include <sys/prctl.h>

#include <cerrno>
#include <optional>
#include <system_error>
#include <utility>

#include "platform/linux/landlock_ruleset.h"
#include "platform/linux/sandbox_profile.h"
#include "platform/linux/sandbox_profile_file.h"
#include "platform/linux/seccomp_filter.h"
#include "platform/linux/user_folders.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/text.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "vlmbind");
constexpr Status kFailed = -1;

std::string message(int errorNumber) { return std::generic_category().message(errorNumber); }

// A place that is not there, or that this user cannot reach anyway, needs no rule.
bool isPassedOver(int errorNumber) {
    return errorNumber == ENOENT || errorNumber == ENOTDIR || errorNumber == EACCES;
}

// Beneath a file there is never anything, so a rule on this is passed over.
constexpr const char* kNowhere = "/dev/null/nowhere";

// Asks for a folder by what the environment names, and by the account when that does not do: to
// look up the account takes as long as the rest of it, or, in a directory, longer.
template <typename Folder>
FolderAnswer folderOfThisProcess(Folder folder) {
    auto answer = folder(UserPlaces::ofThisEnvironment());
    return answer.path.empty() ? folder(UserPlaces::ofThisProcess()) : answer;
}

// The folder of the user's preferences, where there is one of his own: to the home folder of
// somebody else, the superuser's program gets no rule.
SandboxParameter configurationFolder() {
    auto folder = folderOfThisProcess(platform::userConfigurationFolder);
    return {"CONFIG_DIR", folder.path.empty() ? kNowhere : std::move(folder.path)};
}

// Opens every place that the profile names. None, and the reason in `error`, when one is neither
// to be opened nor to be passed over.
std::optional<std::vector<LandlockRule>> openPlaces(const SandboxProfile& profile,
                                                    std::string& error) {
    std::vector<LandlockRule> rules;
    for (const auto& each : profile.paths) {
        FileDescriptor place(open(each.path.c_str(), O_PATH | O_CLOEXEC));
        if (place) {
            rules.push_back({std::move(place), each.access});
        } else if (const int number = errno; !isPassedOver(number)) {
            error =
                text("{}: line {}: {}: {}", profile.file, each.line, each.path, message(number));
            return std::nullopt;
        }
    }
    return rules;
}

// Collects what cannot be confined here, for one line in the log.
class LeftOpen {
public:
    void add(std::string_view what) {
        if (!_list.empty()) _list.append(", ");
        _list.append(what);
    }
    void add(std::string_view mechanism, int errorNumber) {
        _reasons.append(text(" ({}: {})", mechanism, message(errorNumber)));
    }
    void report() const {
        if (!_list.empty())
            kLog.notice("The confinement is incomplete{}; open remain: {}", _reasons, _list);
    }

private:
    std::string _list;
    std::string _reasons;
};

// Each part answers the error number that makes confining fail, 0 when it confined or the kernel
// does not let it.
int confineFiles(const std::vector<LandlockRule>& rules, LeftOpen& leftOpen) {
    const auto answer = enterLandlock(rules);
    if (answer.errorNumber != 0) {
        if (!landlockIsUnavailable(answer.errorNumber)) return answer.errorNumber;
        leftOpen.add("Landlock", answer.errorNumber);
    }
    for (const auto what : leftOpenByLandlock(answer.version)) leftOpen.add(what);
    return 0;
}

int confineCalls(UnixSockets unixSockets, LeftOpen& leftOpen) {
    const auto answer = enterSeccompFilter(unixSockets);
    if (answer.errorNumber == 0) return 0;
    if (!answer.kernelRefused) return answer.errorNumber;
    leftOpen.add("seccomp", answer.errorNumber);
    leftOpen.add("system calls");
    return 0;
}

}  // namespace

FolderAnswer LandlockSandbox::userTemporaryFolder() {
    return folderOfThisProcess(platform::userTemporaryFolder);
}

FolderAnswer LandlockSandbox::userCacheFolder() {
    return folderOfThisProcess(platform::userCacheFolder);
}

SandboxAnswer LandlockSandbox::enter(std::string_view profileName,
                                     const std::vector<SandboxParameter>& parameters) {
    // All that can be wrong with the profile shows before anything is confined.
    auto all = parameters;
    all.push_back(configurationFolder());
    const auto read = readInstalledProfile(profileName, std::move(all));
    if (!read.profile) return {kFailed, read.errorText};
    std::string error;
    auto rules = openPlaces(*read.profile, error);
    if (!rules) return {kFailed, error};

    // Both confinements demand this; without it, they would follow into a set-user-id program.
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0)
        return {kFailed, text("no new privileges: {}", message(errno))};
    LeftOpen leftOpen;
    // Files first: the calls that this takes are none of the filter's business.
    if (const int number = confineFiles(*rules, leftOpen); number != 0)
        return {kFailed, text("Landlock: {}", message(number))};
    const auto sockets = read.profile->unixSockets ? UnixSockets::Allowed : UnixSockets::Refused;
    if (const int number = confineCalls(sockets, leftOpen); number != 0)
        return {kFailed, text("seccomp: {}", message(number))};
    _places = std::move(*rules);
    leftOpen.report();
    return {};
}

Sandbox& Platform::sandbox() {
    static auto& service = *new LandlockSandbox;
    return service;
}

}  // namespace vlm::platform
