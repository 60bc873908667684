// The token cache: which card identities can be paired, and which key of each card can wrap an
// unlock key.

#include <algorithm>
#include <set>
#include <utility>

#include "bind/bind_operation.h"
#include "hints/hints_client.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::Bytes;
using platform::PropertyList;

namespace {

// Identities as a log line shows them; made into text only when somebody collects the line.
struct Described {
    const BindOperation::UnpairedIdentities& identities;
};

std::string toText(const Described& described) {
    PropertyList::Dictionary tokens;
    for (const auto& [token, names] : described.identities) {
        PropertyList::Dictionary shown;
        for (const auto& [hash, name] : names) shown.append(*BindUtils::dataToHex(hash), name);
        tokens.append(token, std::move(shown));
    }
    return PropertyList(std::move(tokens)).describe();
}

// The tokens on which nothing is paired. One paired key is enough to count the whole card as
// paired, since a card belongs to one person.
std::vector<std::string> unpairedTokens(const TokenInfo& info) {
    std::set<std::string> paired;
    const auto countAsPaired = [&](const Bytes& hash) {
        const auto token = info.tokenByHash.find(hash);
        if (token != info.tokenByHash.end()) paired.insert(token->second);
    };
    for (const auto& [account, hash] : info.authentication) countAsPaired(hash);
    for (const auto& [hash, shown] : info.bound) countAsPaired(hash);

    std::vector<std::string> unpaired;
    for (const auto& [token, hashes] : info.hashesByToken)
        if (!paired.contains(token)) unpaired.push_back(token);
    return unpaired;
}

BindOperation::DisplayNames offeredOn(const std::string& token, const TokenInfo& info) {
    BindOperation::DisplayNames names;
    for (const auto& hash : info.hashesByToken.at(token)) {
        const auto offered = info.offered.find(hash);
        if (offered != info.offered.end()) names.insert(*offered);
    }
    return names;
}

// Adds entries, which replace those of the same key; an absent map comes to be.
template <typename Map>
void mergeInto(std::shared_ptr<Map>& all, const Map& more) {
    if (!all) all = std::make_shared<Map>();
    for (const auto& [key, value] : more) all->insert_or_assign(key, value);
}

}  // namespace

std::optional<PropertyList> BindOperation::tokenData(const OptionalText& token) const {
    const auto& log = BindUtils::log();
    log.debug("getting available token data for token: {}", token);

    std::optional<PropertyList::Dictionary> filter;
    if (token) filter = PropertyList::Dictionary{{"tokid", *token}};
    const auto answer = VLCopyAvailableTokensInfo(0, filter);
    const auto* entries = answer ? answer->dictionary() : nullptr;
    if (!entries || entries->empty()) {
        log.debug("cannot get token data for token: {}", token);
        return std::nullopt;
    }

    const auto* context = entries->find("ctx");
    const Bytes* data = context ? context->bytes() : nullptr;
    if (!data) {
        log.error("no context data found for token: {}", token);
        return std::nullopt;
    }

    auto record = platform::readPropertyList(*data);
    if (!record) log.error("cannot deserialize context data for token: {}", token);
    return record;
}

void BindOperation::_updateTokenCache(const OptionalText& token, bool requireWrapKey) {
    const auto& log = BindUtils::log();
    log.notice("updateTokenCache for token: {} (requireWrapKey: {})", token, requireWrapKey);
    if (!token) {
        _unpairedIdentities.set(std::nullopt);
        _wrapKeysHashMap.set(std::nullopt);
    }

    const auto record = tokenData(token);
    if (!record) {
        log.debug("no token data found");
        return;
    }

    const TokenInfo info(*record);
    const auto candidates = unpairedTokens(info);
    if (candidates.empty()) {
        log.debug("cannot find any unmatched identities for user: {}", _userName);
        return;
    }

    // The wrap keys come first: the choice among the candidates looks them up.
    _wrapKeysHashMap.update([&](auto& all) { mergeInto(all, info.wrapKeys); });
    const auto found = offeredIdentities(info, candidates, requireWrapKey);
    log.debug("unpaired identities: {} for token: {}", Described{found}, token);

    _unpairedIdentities.update([&](auto& all) { mergeInto(all, found); });
    if (const auto all = _unpairedIdentities.get())
        log.debug("all unmatched identities: {}", Described{*all});
}

BindOperation::UnpairedIdentities BindOperation::offeredIdentities(
    const TokenInfo& info, const std::vector<std::string>& candidates, bool requireWrapKey) const {
    UnpairedIdentities offered;
    for (const auto& token : candidates) {
        if (!wrapKeyForTokenId(token)) {
            BindUtils::log().notice("No RSA decryption key or ECDH key was found for token: {}",
                                    token);
            if (requireWrapKey) continue;
        }
        auto names = offeredOn(token, info);
        if (!names.empty()) offered.emplace(token, std::move(names));
    }
    return offered;
}

BindOperation::OptionalHash BindOperation::wrapKeyForTokenId(const std::string& token) const {
    const auto wrapKeys = _wrapKeysHashMap.get();
    if (!wrapKeys) return std::nullopt;
    const auto found = std::ranges::find(*wrapKeys, token, &WrapKeysHashMap::value_type::second);
    if (found == wrapKeys->end()) return std::nullopt;
    BindUtils::log().debug("wrap pub key hash found for token: {}", token);
    return found->first;
}

void BindOperation::tokenInserted(const std::string& token) {
    const auto identities = _unpairedIdentities.get();
    if (identities && identities->contains(token)) return;
    _updateTokenCache(token, /*requireWrapKey=*/true);
}

// Only what was offered is taken back. The wrap keys of a token that never was are no offer: they
// are looked up for a token that can be paired, and only then.
void BindOperation::tokenRemoved(const std::string& token) {
    bool wasOffered = false;
    _unpairedIdentities.update([&](auto& all) { wasOffered = all && all->erase(token) > 0; });
    if (!wasOffered) return;
    _wrapKeysHashMap.update([&](auto& all) {
        if (all) std::erase_if(*all, [&](const auto& entry) { return entry.second == token; });
    });
}

}  // namespace vlm
