// Accounts: the account database, local or from a directory.
//
// Threads:   any.
// Blocking:  may wait for a directory server.
// Errors:    an unknown account, and a database that cannot be read, are none.
// Behind it: platform/linux/nss_accounts.h
// In tests:  tests/fakes/fake_accounts.h, tests/contracts/accounts_contract.h

#pragma once

#include <optional>
#include <string>

#include "platform/types.h"

namespace vlm::platform {

class Accounts {
public:
    virtual ~Accounts() = default;

    // The id of the account with this name (UTF-8).
    virtual std::optional<UserId> userId(const std::string& userName) const = 0;

    // The name of the account with this id; none also when the entry has no name.
    virtual std::optional<std::string> userName(UserId userId) const = 0;
};

}  // namespace vlm::platform
