// The keychain that the hints service keeps: asked on the machine's bus, at the daemon. It alone
// can ask the user's desktop for a password, wherever this process runs.

#pragma once

#include <functional>
#include <optional>
#include <utility>

#include "platform/keychain.h"

namespace vlm::platform {

// The daemon gave no status, or could not be reached.
inline constexpr Status kNoKeychainService = -3000;

// Nobody sits at the machine whose keyring it could be.
inline constexpr Status kNobodyAtConsole = -3001;

// The user at the console; none for the superuser, who has no keyring that a card opens.
std::optional<UserId> userAtConsole();

class ServiceKeychain final : public Keychain {
public:
    using Owner = std::function<std::optional<UserId>()>;

    explicit ServiceKeychain(Owner owner = userAtConsole) : _owner(std::move(owner)) {}

    Copied copyLoginKeychain() override;
    Status storeUnlockKey(const Bytes& publicKeyHash, const std::string& token,
                          const Bytes& wrapKeyHash, const LoginKeychain& keychain,
                          const std::string& text) override;
    Status eraseUnlockKey(const Bytes& publicKeyHash) override;

private:
    const Owner _owner;
};

}  // namespace vlm::platform
