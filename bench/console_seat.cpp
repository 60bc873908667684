#include "bench/console_seat.h"

#include <grp.h>
#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

namespace vlm::bench {

namespace {

constexpr uid_t kNobody = 65534;

void must(bool done, const char* what) {
    if (done) return;
    std::perror(what);
    std::exit(2);
}

void write(const std::filesystem::path& file, const std::string& text) {
    std::ofstream(file) << text;
}

void publishSession() {
    const std::filesystem::path sessions = "/run/systemd/sessions";
    std::filesystem::create_directories(sessions);
    write(sessions / "c1",
          "UID=" + std::to_string(getuid()) + "\nACTIVE=1\nSTATE=active\nCLASS=user\nSEAT=seat0\n");
}

// Who is not root may mount only in a user namespace, where he stays who he is.
void enterNamespaces() {
    const std::string user = std::to_string(getuid());
    const std::string group = std::to_string(getgid());
    if (getuid() == 0) return must(unshare(CLONE_NEWNS) == 0, "a mount namespace");
    must(unshare(CLONE_NEWNS | CLONE_NEWUSER) == 0, "a user namespace");
    write("/proc/self/setgroups", "deny");
    write("/proc/self/uid_map", user + ' ' + user + " 1");
    write("/proc/self/gid_map", group + ' ' + group + " 1");
}

void becomeNobody() {
    must(setgroups(0, nullptr) == 0 && setresgid(kNobody, kNobody, kNobody) == 0 &&
             setresuid(kNobody, kNobody, kNobody) == 0,
         "becoming a user without rights");
}

}  // namespace

void sitAtConsole(const std::filesystem::path& run, const std::filesystem::path& home) {
    const bool isRoot = getuid() == 0;
    if (isRoot)
        for (const auto& folder : {run, home})
            must(chown(folder.c_str(), kNobody, kNobody) == 0, folder.c_str());
    enterNamespaces();
    must(mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0, "mounts of its own");
    must(mount(run.c_str(), "/run", nullptr, MS_BIND, nullptr) == 0, "a /run of its own");
    if (isRoot) becomeNobody();
    publishSession();
}

}  // namespace vlm::bench
