// Cards and requests for tests, made with few words.

#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "platform/message.h"
#include "services/hints/exchanges.h"
#include "services/hints/tokens.h"

namespace vlm::service {

inline constexpr std::int64_t kNow = 1'000'000;

inline Bytes hashOf(std::uint8_t number) { return Bytes(32, number); }

// An identity that may sign and is valid now.
inline Identity identityOf(std::uint8_t number, const std::string& name) {
    Identity identity;
    identity.publicKeyHash = hashOf(number);
    identity.publicKeyInfo = Bytes{number};
    identity.name = name;
    identity.notBefore = kNow - 10;
    identity.notAfter = kNow + 10;
    identity.canSign = true;
    return identity;
}

inline Token tokenOf(const std::string& identifier, const std::string& name,
                     std::vector<Identity> identities) {
    Token token;
    token.identifier = identifier;
    token.name = name;
    token.identities = std::move(identities);
    return token;
}

inline IncomingRequest requestOf(std::uint64_t operation,
                                 std::vector<platform::Message::Entry> arguments = {}) {
    IncomingRequest request;
    request.message.set("op", operation);
    for (auto& [key, value] : arguments) request.message.set(key, std::move(value));
    return request;
}

inline platform::Message::Value signedNumber(std::int64_t number) { return number; }
inline platform::Message::Value text(const std::string& value) { return value; }

}  // namespace vlm::service
