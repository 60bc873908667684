#include "platform/linux/seccomp_filter.h"

#include <asm/ioctls.h>
#include <linux/fs.h>
#include <sched.h>
#include <seccomp.h>
#include <sys/socket.h>

#include <array>
#include <cerrno>
#include <cstdint>
#include <memory>

namespace vlm::platform {

namespace {

struct FilterRelease {
    void operator()(void* filter) const { seccomp_release(filter); }
};
using Filter = std::unique_ptr<void, FilterRelease>;

// By name: the library resolves what it knows, and an architecture lacks some of them.
constexpr auto kRefused = std::to_array<const char*>(
    {// starting programs
     "execve", "execveat", "uselib",
     // other processes
     "ptrace", "process_vm_readv", "process_vm_writev", "process_madvise", "pidfd_getfd", "kcmp",
     "move_pages", "migrate_pages",
     // a second way to make system calls, which no filter sees
     "io_uring_setup", "io_uring_enter", "io_uring_register",
     // namespaces, and the tree of files as others see it
     "unshare", "setns", "mount", "umount", "umount2", "pivot_root", "chroot", "mount_setattr",
     "open_tree", "move_mount", "fsopen", "fsconfig", "fsmount", "fspick", "open_by_handle_at",
     "fanotify_init", "quotactl", "quotactl_fd", "acct", "swapon", "swapoff",
     // owners, modes, attributes, device nodes, and before Landlock 3 truncation by name: the rules
     // on files do not cover these
     "chmod", "fchmod", "fchmodat", "fchmodat2", "chown", "fchown", "lchown", "fchownat",
     "setxattr", "lsetxattr", "fsetxattr", "setxattrat", "removexattr", "lremovexattr",
     "fremovexattr", "truncate", "removexattrat", "file_setattr", "mknod", "mknodat",
     // the kernel
     "init_module", "finit_module", "create_module", "delete_module", "kexec_load",
     "kexec_file_load", "reboot", "bpf", "perf_event_open", "userfaultfd", "syslog", "iopl",
     "ioperm", "lookup_dcookie", "nfsservctl", "_sysctl", "sethostname", "setdomainname",
     "settimeofday", "clock_settime", "stime", "vhangup",
     // keys that the kernel keeps
     "keyctl", "add_key", "request_key"});

constexpr auto kNamespaceFlags =
    std::to_array<std::uint64_t>({CLONE_NEWNS, CLONE_NEWCGROUP, CLONE_NEWUTS, CLONE_NEWIPC,
                                  CLONE_NEWUSER, CLONE_NEWPID, CLONE_NEWNET});

// Keystrokes into a terminal, which a shell would read after us, and attributes of files.
constexpr auto kRefusedRequests =
    std::to_array<std::uint64_t>({TIOCSTI, TIOCLINUX, FS_IOC_SETFLAGS, FS_IOC_FSSETXATTR});

class FilterMaker {
public:
    explicit FilterMaker(scmp_filter_ctx filter) : _filter(filter) {}

    // The first error of all rules, 0 for none.
    int error() const { return _error; }

    void refuse(const char* name, int answer) { add(name, answer, nullptr); }

    void refuseWhen(const char* name, int answer, scmp_arg_cmp condition) {
        add(name, answer, &condition);
    }

private:
    void add(const char* name, int answer, const scmp_arg_cmp* condition) {
        const int number = seccomp_syscall_resolve_name(name);
        if (number == __NR_SCMP_ERROR) return;  // younger than the library
        const auto action = SCMP_ACT_ERRNO(static_cast<unsigned>(answer));
        const int result =
            seccomp_rule_add_array(_filter, action, number, condition ? 1 : 0, condition);
        if (result < 0 && _error == 0) _error = -result;
    }

    scmp_filter_ctx _filter;
    int _error = 0;
};

// The kernel looks at the lower half of such an argument only, so the filter must as well.
scmp_arg_cmp lowerHalfIs(unsigned argument, std::uint64_t value) {
    return {argument, SCMP_CMP_MASKED_EQ, 0xFFFFFFFFU, value};
}

scmp_arg_cmp hasFlag(unsigned argument, std::uint64_t flag) {
    return {argument, SCMP_CMP_MASKED_EQ, flag, flag};
}

void refuseSockets(FilterMaker& filter, UnixSockets unixSockets) {
    for (const char* name : {"socket", "socketpair"}) {
        if (unixSockets == UnixSockets::Refused) {
            filter.refuse(name, EAFNOSUPPORT);
        } else {
            filter.refuseWhen(name, EAFNOSUPPORT, {0, SCMP_CMP_NE, AF_UNIX, 0});
        }
    }
}

int fill(scmp_filter_ctx context, UnixSockets unixSockets) {
    FilterMaker filter(context);
    for (const char* each : kRefused) filter.refuse(each, EPERM);
    for (const auto each : kRefusedRequests)
        filter.refuseWhen("ioctl", EPERM, lowerHalfIs(1, each));
    for (const auto each : kNamespaceFlags) filter.refuseWhen("clone", EPERM, hasFlag(0, each));
    // Its flags lie in memory, where no filter can look. The C library then takes clone().
    filter.refuse("clone3", ENOSYS);
    refuseSockets(filter, unixSockets);
    return filter.error();
}

}  // namespace

SeccompAnswer enterSeccompFilter(UnixSockets unixSockets) {
    const Filter filter(seccomp_init(SCMP_ACT_ALLOW));
    if (!filter) return {ENOMEM, false};
    // Each of these makes a good filter better. An old kernel that lacks one still filters this
    // thread, and still ends a thread that calls in the manner of another architecture.
    seccomp_attr_set(filter.get(), SCMP_FLTATR_ACT_BADARCH, SCMP_ACT_KILL_PROCESS);
    seccomp_attr_set(filter.get(), SCMP_FLTATR_CTL_TSYNC, 1);
    seccomp_attr_set(filter.get(), SCMP_FLTATR_CTL_OPTIMIZE, 2);
    seccomp_attr_set(filter.get(), SCMP_FLTATR_API_SYSRAWRC, 1);
    if (const int error = fill(filter.get(), unixSockets); error != 0) return {error, false};
    if (const int error = -seccomp_load(filter.get()); error != 0) return {error, error != ENOMEM};
    return {};
}

}  // namespace vlm::platform
