#pragma once

#include <optional>
#include <string>

#include "platform/accounts.h"
#include "platform/platform.h"

namespace vlm::service {

// The name as the account database spells it, which may differ from how a person does; none when
// there is no such account.
inline std::optional<std::string> spelling(const std::string& account) {
    auto& accounts = platform::current().accounts();
    const auto id = accounts.userId(account);
    if (!id) return std::nullopt;
    return accounts.userName(*id).value_or(account);
}

}  // namespace vlm::service
