// The inserted cards and their identities.

#include <algorithm>
#include <array>
#include <string>
#include <tuple>
#include <vector>

#include "bind/bind_operation.h"
#include "bind/token_info.h"
#include "platform/text.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"
#include "services/vlmctl/shown.h"
#include "services/vlmctl/table.h"

namespace vlm::control {

namespace {

using platform::Bytes;

struct State {
    std::string_view inTable;
    std::string_view inJson;
};

// In the order in which they are listed.
constexpr std::array kStates = {
    State{"used for login", "used"}, State{"paired", "paired"}, State{"unpaired", "unpaired"},
    State{"not usable", "unusable"},  // expired, or unable to sign
};

struct Identity {
    std::size_t state = 0;  // its place in kStates
    std::string name;
    std::string accounts;  // whom it is paired with, as far as the caller may know
    std::string hash;

    auto rank() const { return std::tie(state, name, hash); }
};

template <typename Map, typename Key>
std::string textAt(const Map& map, const Key& key) {
    const auto found = map.find(key);
    return found == map.end() ? std::string() : found->second;
}

std::string accountsUsing(const TokenInfo& info, const Bytes& hash) {
    std::string accounts;
    for (const auto& [account, used] : info.authentication)
        if (used == hash) accounts += (accounts.empty() ? "" : ", ") + account;
    return accounts;
}

Identity identityOf(const TokenInfo& info, const Bytes& hash) {
    Identity identity{
        .name = textAt(info.names, hash), .accounts = {}, .hash = platform::hexadecimal(hash)};
    const auto users = accountsUsing(info, hash);
    const auto paired = textAt(info.bound, hash);
    if (!users.empty()) {
        identity.state = 0;
        // The service names those that log in with it here only when there are no others.
        identity.accounts = paired.empty() || paired == users ? users : users + ", " + paired;
    } else if (info.bound.contains(hash)) {
        identity.state = 1;
        identity.accounts = paired;
    } else {
        identity.state = info.offered.contains(hash) ? 2 : 3;
    }
    return identity;
}

struct Token {
    std::string identifier;
    std::string name;
    std::vector<Identity> identities;
};

// Also the cards that hold nothing: that one is seen is news to whoever misses it.
std::vector<Token> tokensOf(const TokenInfo& info) {
    std::vector<std::string> identifiers = info.tokens;
    for (const auto& [identifier, name] : info.cardNames)
        if (!info.hashesByToken.contains(identifier)) identifiers.push_back(identifier);
    std::ranges::sort(identifiers);

    std::vector<Token> tokens;
    for (const auto& identifier : identifiers) {
        Token token{identifier, textAt(info.cardNames, identifier), {}};
        const auto hashes = info.hashesByToken.find(identifier);
        if (hashes != info.hashesByToken.end())
            for (const auto& hash : hashes->second)
                token.identities.push_back(identityOf(info, hash));
        std::ranges::sort(token.identities, {}, &Identity::rank);
        tokens.push_back(std::move(token));
    }
    return tokens;
}

void printTable(const std::vector<Token>& tokens, const Arguments& arguments, Output& output) {
    Table table({"CARD", "IDENTITY", "STATE", "ACCOUNT", "PUBLIC KEY HASH", "TOKEN"});
    for (const auto& token : tokens) {
        for (const auto& identity : token.identities)
            table.add({token.name, identity.name, std::string(kStates[identity.state].inTable),
                       identity.accounts, identity.hash, token.identifier});
        if (token.identities.empty())
            table.add({token.name, "", "no identities", "", "", token.identifier});
    }
    table.print(output, arguments.legend, "No cards.");
}

Json jsonOf(const std::vector<Token>& tokens) {
    Json::Array list;
    for (const auto& token : tokens) {
        Json::Array identities;
        for (const auto& identity : token.identities)
            identities.emplace_back(Json::Object{
                {"hash", identity.hash},
                {"name", identity.name},
                {"state", kStates[identity.state].inJson},
                {"accounts", identity.accounts.empty() ? Json() : Json(identity.accounts)},
            });
        list.emplace_back(Json::Object{{"token", token.identifier},
                                       {"name", token.name},
                                       {"identities", std::move(identities)}});
    }
    return Json::Object{{"tokens", std::move(list)}};
}

}  // namespace

int listTokens(const Arguments& arguments, Output& output) {
    const auto record = BindOperation::init()->tokenData(std::nullopt);
    if (!record) {
        output.complain(
            "the hints service gave no answer about cards; \"systemctl status vlmhintsd\" and "
            "\"journalctl SUBSYSTEM=org.vlm.token\" say why");
        return kExitFailure;
    }
    const auto tokens = tokensOf(TokenInfo(*record));
    if (arguments.json) {
        output.print(jsonOf(tokens).text());
    } else {
        printTable(tokens, arguments, output);
    }
    return kExitSuccess;
}

}  // namespace vlm::control
