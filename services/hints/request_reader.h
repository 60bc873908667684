// RequestReader: the arguments of one request, read key by key within their bounds.
//
// Errors:  the first key that is wrong is remembered, and the reading goes on with nothing.
// Threads: one.

#pragma once

#include <algorithm>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "platform/property_list.h"
#include "platform/text.h"
#include "services/hints/exchanges.h"
#include "services/hints/outcome.h"
#include "services/hints/secret_pipe.h"
#include "services/hints/status.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace vlm::service {

inline constexpr std::size_t kHashSize = 32;
inline constexpr std::size_t kMostAccountName = 256;
inline constexpr std::size_t kMostTokenIdentifier = 2048;
inline constexpr std::size_t kMostPin = 256;
inline constexpr std::size_t kMostSession = 64;
inline constexpr std::size_t kMostOtherText = 4096;
inline constexpr std::size_t kMostQuery = std::size_t{64} << 10U;
inline constexpr platform::PropertyListLimits kQueryLimits = {
    .depth = 8, .objects = 1024, .bytes = kMostQuery};

class RequestReader {
public:
    explicit RequestReader(const IncomingRequest& incoming) : _incoming(incoming) {
        for (const auto key : {"op", "uid", "dat1", "dat2", "str1", "str2", "str3", "num1"})
            if (std::ranges::find(incoming.unreadableKeys, key) != incoming.unreadableKeys.end())
                refuse(platform::text("\"{}\" is there twice, or of a type that no key has", key));
    }

    std::uint64_t number(std::string_view key) {
        const auto value = message().unsignedInteger(key);
        if (!value) missing(key, "an unsigned whole number");
        return value.value_or(0);
    }

    platform::UserId user() {
        const auto value = message().integer("uid");
        if (!value) return missing("uid", "a signed whole number"), platform::kNobody;
        if (*value < -1 || *value > std::numeric_limits<platform::UserId>::max())
            refuse("\"uid\" is no user id");
        return static_cast<platform::UserId>(*value);
    }

    bool flag(std::string_view key) {
        const auto value = message().integer(key);
        if (!value) return missing(key, "a signed whole number"), false;
        if (*value != 0 && *value != 1)
            refuse(platform::text("\"{}\" must be 0 or 1, and is {}", key, *value));
        return *value == 1;
    }

    bool optionalFlag(std::string_view key) { return isThere(key) && flag(key); }

    std::string text(std::string_view key, std::size_t most) {
        const auto* value = optionalText(key, most);
        if (!value && !_refusal) missing(key, "text");
        return value ? *value : std::string();
    }

    const std::string* optionalText(std::string_view key, std::size_t most) {
        const auto* value = anyText(key, most);
        if (value && value->empty()) refuse(platform::text("\"{}\" is empty", key));
        return value;
    }

    const std::string* anyText(std::string_view key, std::size_t most) {
        const auto* value = message().text(key);
        if (!value && isThere(key)) missing(key, "text");
        if (value && value->size() > most)
            refuse(platform::text("\"{}\" has {} bytes, and {} is the most", key, value->size(),
                                  most));
        return value;
    }

    platform::Bytes hash(std::string_view key = "dat1") {
        const auto* value = message().bytes(key);
        if (!value) return missing(key, "bytes"), platform::Bytes();
        if (value->size() != kHashSize)
            refuse(platform::text("\"{}\" has {} bytes, and a public-key hash has {}", key,
                                  value->size(), kHashSize));
        return *value;
    }

    std::optional<Secret> optionalPin(std::string_view key) {
        if (!isThere(key)) return std::nullopt;
        const auto pipe = message().endpoint(key);
        if (!pipe) return missing(key, "a pipe"), std::nullopt;
        auto pin = secretIn(*pipe);
        if (!pin || pin->text().size() > kMostPin)
            refuse(platform::text("\"{}\" is no pipe that holds a PIN", key));
        return pin;
    }

    std::optional<Secret> passwordInPipe(std::string_view key) {
        const auto pipe = message().endpoint(key);
        if (!pipe) return missing(key, "a pipe"), std::nullopt;
        auto password = secretIn(*pipe);
        if (!password || password->text().size() > kMostUnlockKeyBytes)
            refuse(platform::text("\"{}\" is no pipe that holds a password", key));
        return password;
    }

    // The token that a query of the form {"tokid": token} is restricted to; empty for all tokens.
    std::string queriedToken() {
        if (!isThere("dat1")) return {};
        const auto* bytes = message().bytes("dat1");
        if (!bytes) return missing("dat1", "bytes"), std::string();
        const auto list = platform::readPropertyList(*bytes, kQueryLimits);
        const auto* query = list ? list->dictionary() : nullptr;
        if (!query)
            return refuse("\"dat1\" is no small dictionary in a property list"), std::string();
        const auto* token = query->find("tokid");
        if (!token) return {};
        if (!token->text() || token->text()->empty() ||
            token->text()->size() > kMostTokenIdentifier)
            return refuse("\"tokid\" in \"dat1\" is no token identifier"), std::string();
        return *token->text();
    }

    void refuse(const std::string& why) {
        if (!_refusal)
            _refusal = Refusal{status::kBadRequest,
                               platform::text("The request cannot be understood: {}.", why)};
    }

    const std::optional<Refusal>& refusal() const { return _refusal; }

private:
    const platform::Message& message() const { return _incoming.message; }

    bool isThere(std::string_view key) const { return message().contains(key); }

    void missing(std::string_view key, std::string_view wanted) {
        if (isThere(key))
            refuse(platform::text("\"{}\" must hold {}", key, wanted));
        else
            refuse(platform::text("\"{}\" is missing", key));
    }

    const IncomingRequest& _incoming;
    std::optional<Refusal> _refusal;
};

}  // namespace vlm::service
