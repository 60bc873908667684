#include "services/hints/token_info.h"

#include <set>
#include <utility>

namespace vlm::service {

namespace {

using platform::PropertyList;

// Whether the identity may be offered for a pairing now.
bool isUsable(const Identity& identity, std::int64_t now) {
    return identity.canSign && identity.validAt(now);
}

// Whether login would accept it, too.
bool isGoodForLogin(const Identity& identity, std::int64_t now) {
    return isUsable(identity, now) && identity.distrust.empty();
}

const std::vector<Pairing>& pairingsWith(const Bytes& hash, const PairingsByHash& pairings) {
    static const std::vector<Pairing> kNone;
    const auto found = pairings.find(hash);
    return found == pairings.end() ? kNone : found->second;
}

// Account to the pairing that logs it in: of those that login would accept now, the latest.
std::map<std::string, Pairing> chooseForAuthentication(const std::vector<Token>& inserted,
                                                       const PairingsByHash& pairings,
                                                       std::int64_t now) {
    std::map<std::string, Pairing> chosen;
    for (const auto& token : inserted) {
        for (const auto& identity : token.identities) {
            if (!isGoodForLogin(identity, now)) continue;
            for (const auto& pairing : pairingsWith(identity.publicKeyHash, pairings)) {
                auto& latest = chosen[pairing.account];
                if (latest.sequence < pairing.sequence) latest = pairing;
            }
        }
    }
    return chosen;
}

// The accounts that the hash is paired with, for people. Those that log in with it come in another
// list already, and are named here only when there are no others.
std::string accountsText(const std::vector<Pairing>& pairings,
                         const std::map<std::string, Pairing>& chosen,
                         const TokenInfoRequest& request) {
    std::set<std::string> named;
    std::set<std::string> logInWithIt;
    bool others = false;
    for (const auto& pairing : pairings) {
        if (request.onlyAccount && pairing.account != *request.onlyAccount) {
            others = true;
            continue;
        }
        const auto choice = chosen.find(pairing.account);
        const bool isChosen = choice != chosen.end() && choice->second.hash == pairing.hash;
        (isChosen ? logInWithIt : named).insert(pairing.account);
    }
    if (named.empty() && !others) named = std::move(logInWithIt);

    std::string text;
    for (const auto& account : named) text += (text.empty() ? "" : ", ") + account;
    if (others) text += text.empty() ? "another account" : ", another account";
    return text;
}

// Two arrays of the record: the keys of a map, and their values.
struct ParallelArrays {
    PropertyList::Array keys;
    PropertyList::Array values;

    void add(const PropertyList& key, const PropertyList& value) {
        keys.push_back(key);
        values.push_back(value);
    }
};

struct Record {
    ParallelArrays tokenOfHash;
    ParallelArrays offered;
    ParallelArrays paired;
    ParallelArrays wrapKeys;
    ParallelArrays identityNames;
    PropertyList::Dictionary authentication;
    PropertyList::Dictionary tokenNames;

    PropertyList list() && {
        return PropertyList::Dictionary{
            {"tnh", std::move(tokenOfHash.keys)},     {"tni", std::move(tokenOfHash.values)},
            {"unk", std::move(offered.keys)},         {"unv", std::move(offered.values)},
            {"hsk", std::move(paired.keys)},          {"hsv", std::move(paired.values)},
            {"hsh", std::move(authentication)},       {"uth", std::move(wrapKeys.keys)},
            {"uti", std::move(wrapKeys.values)},      {"fnh", std::move(identityNames.keys)},
            {"fni", std::move(identityNames.values)}, {"ftn", std::move(tokenNames)},
        };
    }
};

}  // namespace

PropertyList tokenInfo(const std::vector<Token>& inserted, const PairingsByHash& pairings,
                       const TokenInfoRequest& request) {
    const auto chosen = chooseForAuthentication(inserted, pairings, request.now);
    Record record;
    std::set<Bytes> covered;
    for (const auto& token : inserted) {
        if (!request.onlyToken.empty() && token.identifier != request.onlyToken) continue;
        record.tokenNames.set(token.identifier, token.name);
        if (token.wrapKeyHash) record.wrapKeys.add(*token.wrapKeyHash, token.identifier);
        for (const auto& identity : token.identities) {
            const auto& hash = identity.publicKeyHash;
            const auto& paired = pairingsWith(hash, pairings);
            covered.insert(hash);
            record.tokenOfHash.add(hash, token.identifier);
            record.identityNames.add(hash, identity.name);
            if (!paired.empty())
                record.paired.add(hash, accountsText(paired, chosen, request));
            else if (isUsable(identity, request.now))
                record.offered.add(hash, identity.name);
        }
    }
    for (const auto& [account, pairing] : chosen) {
        const bool isTold = !request.onlyAccount || *request.onlyAccount == account;
        if (isTold && covered.contains(pairing.hash))
            record.authentication.set(account, pairing.hash);
    }
    return std::move(record).list();
}

}  // namespace vlm::service
