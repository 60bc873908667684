#include "platform/linux/landlock_ruleset.h"

#include <linux/landlock.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>

namespace vlm::platform {

namespace {

// The names that the oldest supported kernel headers lack, with the kernel's own values.
constexpr std::uint64_t kTruncate = 1ULL << 14U;     // LANDLOCK_ACCESS_FS_TRUNCATE
constexpr std::uint64_t kIoctlDevice = 1ULL << 15U;  // LANDLOCK_ACCESS_FS_IOCTL_DEV
constexpr std::uint64_t kBindTcp = 1ULL << 0U;       // LANDLOCK_ACCESS_NET_BIND_TCP
constexpr std::uint64_t kConnectTcp = 1ULL << 1U;    // LANDLOCK_ACCESS_NET_CONNECT_TCP
constexpr std::uint64_t kScopeSignal = 1ULL << 1U;   // LANDLOCK_SCOPE_SIGNAL

// struct landlock_ruleset_attr as of version 6. An older kernel takes it as long as what it does
// not know is zero.
struct RulesetAttributes {
    std::uint64_t handledFiles;
    std::uint64_t handledNetwork;
    std::uint64_t scoped;
};

constexpr std::uint64_t kFirstVersion =
    LANDLOCK_ACCESS_FS_EXECUTE | LANDLOCK_ACCESS_FS_WRITE_FILE | LANDLOCK_ACCESS_FS_READ_FILE |
    LANDLOCK_ACCESS_FS_READ_DIR | LANDLOCK_ACCESS_FS_REMOVE_DIR | LANDLOCK_ACCESS_FS_REMOVE_FILE |
    LANDLOCK_ACCESS_FS_MAKE_CHAR | LANDLOCK_ACCESS_FS_MAKE_DIR | LANDLOCK_ACCESS_FS_MAKE_REG |
    LANDLOCK_ACCESS_FS_MAKE_SOCK | LANDLOCK_ACCESS_FS_MAKE_FIFO | LANDLOCK_ACCESS_FS_MAKE_BLOCK |
    LANDLOCK_ACCESS_FS_MAKE_SYM;

// Rights that a rule on something else than a folder can give.
constexpr std::uint64_t kOfFiles =
    LANDLOCK_ACCESS_FS_WRITE_FILE | LANDLOCK_ACCESS_FS_READ_FILE | kTruncate;

constexpr std::uint64_t kReading = LANDLOCK_ACCESS_FS_READ_FILE | LANDLOCK_ACCESS_FS_READ_DIR;

// No rule lets a program start, a device be made, or one be controlled.
constexpr std::uint64_t kNeverAllowed = LANDLOCK_ACCESS_FS_EXECUTE | LANDLOCK_ACCESS_FS_MAKE_CHAR |
                                        LANDLOCK_ACCESS_FS_MAKE_BLOCK | kIoctlDevice;

int kernelVersion() {
    return static_cast<int>(
        syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION));
}

bool addRule(const FileDescriptor& ruleset, const LandlockRule& rule, std::uint64_t handled) {
    struct stat status {};
    if (fstat(rule.place.get(), &status) != 0) return false;
    struct landlock_path_beneath_attr beneath {};
    beneath.allowed_access = allowedFileRights(rule.access, S_ISDIR(status.st_mode), handled);
    beneath.parent_fd = rule.place.get();
    return syscall(SYS_landlock_add_rule, ruleset.get(), LANDLOCK_RULE_PATH_BENEATH, &beneath, 0) ==
           0;
}

}  // namespace

LandlockRights landlockRights(int version) {
    LandlockRights rights;
    if (version >= 1) rights.files = kFirstVersion;
    if (version >= 2) rights.files |= LANDLOCK_ACCESS_FS_REFER;
    if (version >= 3) rights.files |= kTruncate;
    if (version >= 4) rights.network = kBindTcp | kConnectTcp;
    if (version >= 5) rights.files |= kIoctlDevice;
    // Abstract unix sockets stay reachable: some session buses listen on one.
    if (version >= 6) rights.scoped = kScopeSignal;
    return rights;
}

std::uint64_t allowedFileRights(PathAccess access, bool isFolder, std::uint64_t handled) {
    std::uint64_t allowed = access == PathAccess::Write ? ~kNeverAllowed : kReading;
    if (!isFolder) allowed &= kOfFiles;
    return allowed & handled;
}

std::vector<std::string_view> leftOpenByLandlock(int version) {
    if (version < 1) return {"files outside the tool's folders", "signals to other programs"};
    std::vector<std::string_view> open;
    if (version < 5) open.emplace_back("control of devices");
    if (version < 6) open.emplace_back("signals to other programs");
    return open;
}

LandlockAnswer enterLandlock(const std::vector<LandlockRule>& rules) {
    const int version = kernelVersion();
    if (version < 0) return {0, errno};

    const LandlockRights rights = landlockRights(version);
    const RulesetAttributes attributes{rights.files, rights.network, rights.scoped};
    const FileDescriptor ruleset(
        static_cast<int>(syscall(SYS_landlock_create_ruleset, &attributes, sizeof attributes, 0)));
    if (!ruleset) return {0, errno};
    for (const auto& each : rules)
        if (!addRule(ruleset, each, rights.files)) return {0, errno};
    if (syscall(SYS_landlock_restrict_self, ruleset.get(), 0) != 0) return {0, errno};
    return {version, 0};
}

bool landlockIsUnavailable(int errorNumber) {
    // E2BIG: the kernel confines a process only so many times, and others did so before.
    return errorNumber == ENOSYS || errorNumber == EOPNOTSUPP || errorNumber == EPERM ||
           errorNumber == E2BIG;
}

}  // namespace vlm::platform
