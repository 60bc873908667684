// The unlock key: what opens the login keyring after a login with the card. Decided here is when it
// may be stored and with what; the keychain does the work.

#include "bind/bind_operation.h"
#include "platform/keychain.h"
#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/token_framework.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::current;
using platform::Error;
using platform::kSuccess;
using platform::Status;

namespace {

// The keychain belongs to who sits at the machine, and so must the card.
bool isAtConsole(const BindOperation::OptionalText& userName) {
    return userName && BindUtils::userNameForUserId(BindUtils::currentLoggedInUserId()) == userName;
}

}  // namespace

Status BindOperation::storeUnlockKey(const OptionalHash& publicKeyHash, ErrorPlace error) {
    const auto& log = BindUtils::log();
    const auto refuse = [error](OptionalText why) {
        if (error) *error = Error{std::string(platform::VLErrorDomain), kRefused, std::move(why)};
        return kRefused;
    };
    auto& texts = current().localization();
    if (!isAtConsole(_userName)) return refuse(texts.text("STORE_UNLOCK_KEY_CURRENT_USER_ERROR"));
    const auto token = tokenIdForUnpairedPubKeyHash(publicKeyHash);
    if (!token) {
        log.notice("cannot find unpaired public key hash: {}", publicKeyHash);
        return refuse(std::nullopt);
    }
    const auto wrapKeyHash = wrapKeyForTokenId(*token);
    if (!wrapKeyHash) return refuse(texts.text("NO_WRAP_KEY_ERROR"));

    const Status status = _storeUnlockKey(*publicKeyHash, *token, *wrapKeyHash);
    log.debug("storeUnlockKeyWithPubKeyHash: {}", status);
    log.notice("storeUnlockKey = {}, error: {} (user = {}, pubkey hash: {})", status,
               error ? *error : std::nullopt, _userName, BindUtils::dataToHex(publicKeyHash));
    return status;
}

Status BindOperation::_storeUnlockKey(const Bytes& publicKeyHash, const std::string& token,
                                      const Bytes& wrapKeyHash) const {
    const auto& log = BindUtils::log();
    auto& keychain = current().keychain();
    const auto copied = keychain.copyLoginKeychain();
    log.debug("copyLoginKeychain: {}", copied.status);
    if (copied.status != kSuccess) return copied.status;
    const Status status =
        keychain.storeUnlockKey(publicKeyHash, token, wrapKeyHash, *copied.keychain, "");
    log.debug("keychain storeUnlockKey: {}", status);
    return status;
}

}  // namespace vlm
