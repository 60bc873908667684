#include "platform/linux/nss_accounts.h"

#include <pwd.h>

#include <cerrno>
#include <vector>

#include "platform/platform.h"

namespace vlm::platform {

namespace {

// Most entries fit into the first size. An entry that does not fit into the last one is a broken
// one.
constexpr std::size_t kFirstSize = 1024;
constexpr std::size_t kLastSize = std::size_t{1} << 20U;

// Runs getpwnam_r() or getpwuid_r() with room enough, and takes from the entry what is asked for
// while that room is there.
template <typename LookUp, typename Take>
auto findEntry(LookUp lookUp, Take take) -> decltype(take(passwd())) {
    for (std::size_t size = kFirstSize; size <= kLastSize;) {
        std::vector<char> room(size);
        passwd entry{};
        passwd* found = nullptr;
        const int result = lookUp(&entry, room.data(), room.size(), &found);
        if (result == 0 && found) return take(*found);
        if (result == ERANGE) {
            size *= 2;
        } else if (result != EINTR) {
            break;
        }
    }
    return std::nullopt;
}

}  // namespace

std::optional<UserId> NssAccounts::userId(const std::string& userName) const {
    // The database would see the part before the zero only, and find somebody else.
    if (userName.find('\0') != userName.npos) return std::nullopt;
    return findEntry([&](auto... room) { return ::getpwnam_r(userName.c_str(), room...); },
                     [](const passwd& entry) -> std::optional<UserId> {
                         if (entry.pw_uid == kNobody) return std::nullopt;
                         return entry.pw_uid;
                     });
}

std::optional<std::string> NssAccounts::userName(UserId userId) const {
    return findEntry([&](auto... room) { return ::getpwuid_r(userId, room...); },
                     [](const passwd& entry) -> std::optional<std::string> {
                         if (!entry.pw_name || !*entry.pw_name) return std::nullopt;
                         return entry.pw_name;
                     });
}

Accounts& Platform::accounts() {
    static auto& service = *new NssAccounts;
    return service;
}

}  // namespace vlm::platform
