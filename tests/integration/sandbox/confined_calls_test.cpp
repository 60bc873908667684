// The system calls that a confined program can no longer make.

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstring>

#include "platform/linux/file_descriptor.h"
#include "probe_test.h"

namespace vlm::test {

namespace {

using platform::FileDescriptor;

class ConfinedCallsTest : public ProbeTest {};

FileDescriptor listenOn(const std::string& path) {
    struct sockaddr_un address {};
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    FileDescriptor listener(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    const auto* generic = static_cast<const struct sockaddr*>(static_cast<const void*>(&address));
    if (bind(listener.get(), generic, sizeof address) != 0) return {};
    if (listen(listener.get(), 1) != 0) return {};
    return listener;
}

}  // namespace

TEST_F(ConfinedCallsTest, NoProgramStarts) {
    for (const char* way : {"execve", "execve-from-memory", "posix_spawn", "system"}) {
        SCOPED_TRACE(way);
        EXPECT_EQ(probe({way}).result, EPERM);
        EXPECT_EQ(probe({"in-child", way}).result, EPERM);

        // One that starts takes the probe's place and prints no result.
        const auto open = probeOpen({way});
        EXPECT_EQ(open.result.value_or(0), 0) << "not because of confinement";
        EXPECT_EQ(open.status, 0);
    }
}

TEST_F(ConfinedCallsTest, OnlySocketsOfTheUnixFamilyOpen) {
    for (const char* family : {"inet", "inet6", "netlink", "packet", "bluetooth", "vsock", "alg"}) {
        SCOPED_TRACE(family);
        EXPECT_EQ(probe({"socket", family}).result, EAFNOSUPPORT);
        EXPECT_EQ(probe({"in-thread", "socket", family}).result, EAFNOSUPPORT);
        EXPECT_EQ(probe({"in-child", "socket", family}).result, EAFNOSUPPORT);
    }
    EXPECT_EQ(probeOpen({"socket", "inet"}).result, 0);
    EXPECT_EQ(probeOpen({"socket", "netlink"}).result, 0);
    EXPECT_EQ(probe({"socket-with-upper-bit"}).result, EAFNOSUPPORT);
    EXPECT_EQ(probe({"socket", "unix"}).result, 0);
}

TEST_F(ConfinedCallsTest, AUnixServerCanBeTalkedTo) {
    const std::string path = elsewhere() / "server";
    const auto listener = listenOn(path);
    ASSERT_TRUE(listener);

    Child client(command({"talk", path}), options());
    const FileDescriptor peer(accept4(listener.get(), nullptr, nullptr, SOCK_CLOEXEC));
    std::array<char, 4> question{};
    ASSERT_EQ(recv(peer.get(), question.data(), question.size(), MSG_WAITALL), 4);
    ASSERT_EQ(send(peer.get(), "pong", 4, MSG_NOSIGNAL), 4);

    EXPECT_EQ(client.wait(), 0);
    // Where a part of the confinement is missing, a log line comes first.
    EXPECT_TRUE(client.output().ends_with("result: 0\n")) << client.output();
}

TEST_F(ConfinedCallsTest, CallsThatAToolHasNoUseForAreRefused) {
    for (const char* call : {"execve",
                             "execveat",
                             "ptrace",
                             "process_vm_readv",
                             "process_vm_writev",
                             "pidfd_getfd",
                             "io_uring_setup",
                             "io_uring_enter",
                             "io_uring_register",
                             "unshare",
                             "setns",
                             "mount",
                             "umount2",
                             "pivot_root",
                             "chroot",
                             "open_tree",
                             "move_mount",
                             "fsopen",
                             "mount_setattr",
                             "open_by_handle_at",
                             "fanotify_init",
                             "swapon",
                             "swapoff",
                             "fchmod",
                             "fchown",
                             "fchmodat",
                             "fchownat",
                             "fsetxattr",
                             "mknodat",
                             "init_module",
                             "finit_module",
                             "delete_module",
                             "kexec_load",
                             "reboot",
                             "bpf",
                             "perf_event_open",
                             "userfaultfd",
                             "syslog",
                             "sethostname",
                             "settimeofday",
                             "clock_settime",
                             "keyctl",
                             "add_key",
                             "request_key"}) {
        SCOPED_TRACE(call);
        EXPECT_EQ(probe({"call", call}).result, EPERM);
    }
}

TEST_F(ConfinedCallsTest, NoFileIsCutByItsName) {
    EXPECT_EQ(probe({"truncate", fileIn(elsewhere())}).result, EPERM);
    EXPECT_EQ(probe({"truncate", fileIn(home() / ".config/vlm")}).result, EPERM);
    EXPECT_EQ(probeOpen({"truncate", fileIn(elsewhere())}).result, 0);
}

TEST_F(ConfinedCallsTest, RefusalsDoNotComeFromNonsensicalArguments) {
    for (const char* call : {"ptrace", "io_uring_setup", "setns", "unshare", "fchmod"}) {
        SCOPED_TRACE(call);
        EXPECT_NE(probeOpen({"call", call}).result, EPERM);
    }
}

TEST_F(ConfinedCallsTest, NoNewNamespaceIsMadeAndThreadsStillStart) {
    EXPECT_EQ(probe({"clone-into-namespace"}).result, EPERM);
    EXPECT_EQ(probe({"call", "clone3"}).result, ENOSYS);
    EXPECT_EQ(probe({"in-thread", "read", "/etc/passwd"}).result, 0);
    EXPECT_EQ(probe({"in-child", "read", "/etc/passwd"}).result, 0);
}

TEST_F(ConfinedCallsTest, NothingIsTypedIntoTheTerminal) {
    EXPECT_EQ(probe({"type-into-terminal"}).result, EPERM);
    EXPECT_EQ(probe({"type-into-terminal-with-upper-bit"}).result, EPERM);
    EXPECT_EQ(probeOpen({"type-into-terminal"}).result, ENOTTY);
}

TEST_F(ConfinedCallsTest, AccountsCanBeLookedUp) {
    EXPECT_EQ(probe({"account", "root"}).result, 0);
    EXPECT_EQ(probe({"account", "no such account"}).result, ENOENT);
}

TEST_F(ConfinedCallsTest, NoPrivilegesAreGained) {
    EXPECT_EQ(probe({"gain-privileges"}).result, EPERM);
    EXPECT_EQ(probeOpen({"gain-privileges"}).result, 0);
}

TEST_F(ConfinedCallsTest, ACallInTheMannerOfAnotherArchitectureEndsTheProcess) {
#if !defined(__x86_64__)
    GTEST_SKIP() << "this machine has one manner of calling only";
#endif
    constexpr int kKilledByFilter = 128 + SIGSYS;
    EXPECT_EQ(probe({"x32-call"}).status, kKilledByFilter);
    if (probeOpen({"32-bit-call"}).status != 0)
        GTEST_SKIP() << "this kernel runs no 32-bit programs";
    EXPECT_EQ(probe({"32-bit-call"}).status, kKilledByFilter);
}

}  // namespace vlm::test
