#include "platform/linux/posix_process_info.h"

#include <unistd.h>

#include "platform/linux/nss_accounts.h"
#include "platform/platform.h"

namespace vlm::platform {

UserId PosixProcessInfo::realUserId() const { return ::getuid(); }

UserId PosixProcessInfo::effectiveUserId() const { return ::geteuid(); }

std::string PosixProcessInfo::ownerUserName() const {
    const UserId owner = ::geteuid();
    return NssAccounts().userName(owner).value_or(std::to_string(owner));
}

ProcessInfo& Platform::processInfo() {
    static auto& service = *new PosixProcessInfo;
    return service;
}

}  // namespace vlm::platform
