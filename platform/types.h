// The small value types that every floor of this system speaks in.
//
// Bytes:   opaque binary data; a public-key hash is Bytes, compared bytewise.
// UserId:  the platform's 32-bit user id; kNobody (all bits set, also read as -1) means no user.
// Status:  0 for success; any other number is a failure of the service that returned it.
// Error:   what went wrong, for programs (domain, code) and for people (localizedDescription).
//          Errors are handed out through an optional place next to a status, never thrown.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vlm::platform {

using Bytes = std::vector<std::uint8_t>;
using UserId = std::uint32_t;
using Status = std::int32_t;

inline constexpr UserId kNobody = 0xFFFFFFFFU;
inline constexpr Status kSuccess = 0;

struct Error {
    std::string domain;
    std::int32_t code = 0;
    std::optional<std::string>
        localizedDescription;  // UTF-8, for the person in front of the screen

    // The sentence to show: the localized description, else one made of domain and code.
    std::string description() const {
        if (localizedDescription) return *localizedDescription;
        return "The operation could not be completed. (" + domain + " error " +
               std::to_string(code) + ")";
    }

    bool operator==(const Error&) const = default;
};

// Where a caller wants an error object to be put; null when the caller does not want it.
using ErrorPlace = std::optional<Error>*;

}  // namespace vlm::platform
