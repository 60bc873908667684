// The account database of the C library: local files, directories, whatever nsswitch.conf names.

#pragma once

#include "platform/accounts.h"

namespace vlm::platform {

class NssAccounts final : public Accounts {
public:
    std::optional<UserId> userId(const std::string& userName) const override;
    std::optional<std::string> userName(UserId userId) const override;
};

}  // namespace vlm::platform
