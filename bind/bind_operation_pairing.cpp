// Pairing: the hints service logs in to the card and records the pairing; this is what is asked of
// it, in which order, and what is said when it refuses.

#include <algorithm>
#include <set>
#include <utility>

#include "bind/bind_operation.h"
#include "hints/hints_client.h"
#include "platform/keychain.h"
#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/token_framework.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::Error;
using platform::kSuccess;
using platform::Status;

BindOperation::OptionalText BindOperation::tokenIdForUnpairedPubKeyHash(
    const OptionalHash& publicKeyHash) const {
    OptionalText token;
    const auto identities = _unpairedIdentities.get();
    if (identities && publicKeyHash) {
        const auto holder = std::ranges::find_if(
            *identities, [&](const auto& entry) { return entry.second.contains(*publicKeyHash); });
        if (holder != identities->end()) token = holder->first;
    }
    BindUtils::log().debug("found unpaired token: {} for pubKeyHash: {}", token,
                           BindUtils::dataToHex(publicKeyHash));
    return token;
}

bool BindOperation::_isSmartCardPaired(const OptionalHash& publicKeyHash) const {
    const auto record = tokenData(std::nullopt);
    if (!record) {
        BindUtils::log().debug("no token data found");
        return false;
    }
    const TokenInfo info(*record);
    if (!publicKeyHash || !info.tokenByHash.contains(*publicKeyHash)) return false;

    std::set<Bytes> bound(info.boundHashes.begin(), info.boundHashes.end());
    for (const auto& [account, hash] : info.authentication) bound.insert(hash);
    const auto& onTheCard = info.hashesByToken.at(info.tokenByHash.at(*publicKeyHash));
    return std::ranges::any_of(onTheCard, [&](const auto& hash) { return bound.contains(hash); });
}

Status BindOperation::pairUser(const OptionalHash& publicKeyHash, bool requireWrapKey,
                               ErrorPlace error) {
    if (!_unpairedIdentities.get()) _updateTokenCache(std::nullopt, requireWrapKey);
    const auto token = tokenIdForUnpairedPubKeyHash(publicKeyHash);
    if (!token) return refusePairing(publicKeyHash, error);
    return loginAndBind(*token, publicKeyHash, error);
}

// Why the key cannot be paired is found out only for a caller who wants to know: it takes another
// question to the hints service.
Status BindOperation::refusePairing(const OptionalHash& publicKeyHash, ErrorPlace error) const {
    BindUtils::log().notice("cannot find unpaired public key hash: {}",
                            BindUtils::dataToHex(publicKeyHash));
    if (error) {
        Error refusal{std::string(platform::VLErrorDomain), kRefused, std::nullopt};
        if (_isSmartCardPaired(publicKeyHash))
            refusal.localizedDescription =
                platform::current().localization().text("SC_IS_ALREADY_PAIRED");
        *error = std::move(refusal);
    }
    return kRefused;
}

Status BindOperation::loginAndBind(const std::string& token, const OptionalHash& publicKeyHash,
                                   ErrorPlace error) const {
    const auto& log = BindUtils::log();
    std::optional<Error> serviceError;
    Status status =
        VLPerformLogin(0, token, publicKeyHash, std::nullopt, std::nullopt, &serviceError);
    log.debug("VLPerformLogin: {}, error: {}", status, serviceError);
    if (status == kSuccess) {
        status = VLBindUser(_userName, publicKeyHash, &serviceError);
        log.debug("VLBindUser: {}", status);
    }

    if (!error) serviceError.reset();
    log.notice("pairUser = {}, error: {} (user = {}, pubkey hash: {})", status, serviceError,
               _userName, BindUtils::dataToHex(publicKeyHash));
    if (serviceError) *error = std::move(serviceError);
    return status;
}

Status BindOperation::unpairUser(const OptionalHash& publicKeyHash, const OptionalText& userName,
                                 ErrorPlace error) {
    const OptionalText& user = userName ? userName : _userName;
    std::optional<Error> serviceError;
    const Status status = VLUnbindUser(user, publicKeyHash, &serviceError);
    BindUtils::log().debug("VLUnbindUser: {}", status);
    if (status == kSuccess && user && user == _userName) eraseUnlockKey(publicKeyHash, user);
    if (error && serviceError) *error = std::move(serviceError);
    return status;
}

// The pairing is gone already, so an unlock key that cannot be erased is only worth a line.
void BindOperation::eraseUnlockKey(const OptionalHash& publicKeyHash,
                                   const OptionalText& user) const {
    if (!publicKeyHash) return;
    const auto& log = BindUtils::log();
    log.notice("unpairing keychain");
    const Status status = platform::current().keychain().eraseUnlockKey(*publicKeyHash);
    log.notice("unpairUser = {}, (user = {}, pubkey hash: {})", status, user,
               BindUtils::dataToHex(publicKeyHash));
}

}  // namespace vlm
