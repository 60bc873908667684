// TokenInfo: what the hints service tells about the inserted tokens, as maps that can be asked.
//
// Shapes:   the record is a dictionary of parallel arrays: an element of the first array of a pair
//           is a key, the element at the same place of the second its value. A key that comes twice
//           keeps its last value.
// Threads:  a value; distinct values are independent.
// Errors:   none. The record comes from another process and is not believed: elements of a wrong
//           type are passed over, the shorter array of a pair counts, and a record that is no
//           dictionary says nothing at all.
// In tests: tests/unit/bind/token_info_test.cpp

#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "platform/property_list.h"
#include "platform/types.h"

namespace vlm {

struct TokenInfo {
    using TextByHash = std::map<platform::Bytes, std::string>;

    TokenInfo() = default;
    explicit TokenInfo(const platform::PropertyList& record);

    std::vector<std::string> tokens;  // every token named, each once, sorted
    TextByHash tokenByHash;           // the token that holds each key
    std::map<std::string, std::vector<platform::Bytes>> hashesByToken;  // and the other way round

    TextByHash offered;   // display names of what can be paired
    TextByHash bound;     // what to show before the name of a hash that is paired
    TextByHash names;     // the identity's name
    TextByHash wrapKeys;  // the token of each key that can wrap an unlock key
    std::map<std::string, std::string> cardNames;  // by token

    std::vector<platform::Bytes> boundHashes;  // as listed, also those with nothing to show
    std::vector<std::pair<std::string, platform::Bytes>> authentication;  // account, its hash
};

}  // namespace vlm
