// The token info record: what a caller is told about the inserted cards.
//
// A dictionary of parallel arrays; the keys and their meaning are in README.md. Tokens come by
// identifier and identities by hash, whatever order a card module has.
//
// Threads: a function of its arguments. Errors: none.
// In tests: tests/unit/services/token_info_test.cpp

#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "platform/property_list.h"
#include "services/hints/pairing_store.h"
#include "services/hints/tokens.h"

namespace vlm::service {

using PairingsByHash = std::map<platform::Bytes, std::vector<Pairing>>;

struct TokenInfoRequest {
    // The account whose pairings are told by name; none for a caller who is told all. Those of
    // other accounts count, and show as "another account".
    std::optional<std::string> onlyAccount = {};
    std::string onlyToken = {};  // the one token that the record covers; empty for all
    std::int64_t now = 0;        // seconds since 1970-01-01 00:00:00 UTC
};

// `inserted` are all inserted tokens, `pairings` those of every identity on them.
platform::PropertyList tokenInfo(const std::vector<Token>& inserted, const PairingsByHash& pairings,
                                 const TokenInfoRequest& request);

}  // namespace vlm::service
