// ProcessInfo: whose process this is.
//
// Threads:   any.
// Blocking:  ownerUserName() may wait for the account database.
// Errors:    none; the kernel always knows.
// Behind it: platform/linux/posix_process_info.h
// In tests:  tests/fakes/fake_process_info.h, tests/contracts/process_info_contract.h

#pragma once

#include <string>

#include "platform/types.h"

namespace vlm::platform {

class ProcessInfo {
public:
    virtual ~ProcessInfo() = default;

    virtual UserId realUserId() const = 0;

    // What the process may do; differs from the real id in a set-user-id program.
    virtual UserId effectiveUserId() const = 0;

    // The name of the user that the process runs as (its effective user), or the user id in
    // decimal when that user has no account.
    virtual std::string ownerUserName() const = 0;
};

}  // namespace vlm::platform
