#include "services/hints/pcscd_socket.h"

#include <sys/inotify.h>

#include <cstdlib>

namespace vlm::service {

std::filesystem::path PcscdSocket::usualPlace() {
    const char* elsewhere = secure_getenv("PCSCLITE_CSOCK_NAME");
    return elsewhere ? elsewhere : "/run/pcscd/pcscd.comm";
}

void PcscdSocket::watch() {
    constexpr auto kComings = IN_CREATE | IN_MOVED_TO | IN_DELETE_SELF | IN_MOVE_SELF | IN_ONLYDIR;
    platform::FileDescriptor changes(inotify_init1(IN_CLOEXEC | IN_NONBLOCK));
    for (auto folder = _place.parent_path();; folder = folder.parent_path()) {
        if (inotify_add_watch(changes.get(), folder.c_str(), kComings) >= 0) break;
        if (!folder.has_relative_path()) {
            changes = {};
            break;
        }
    }
    _changes = std::move(changes);
}

}  // namespace vlm::service
