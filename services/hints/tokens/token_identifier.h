// The identifier of a token: its PKCS#11 URI (RFC 7512).

#pragma once

#include <string>
#include <string_view>
#include <tuple>

namespace vlm::service {

// The four fields as the module gives them, padded with blanks at the end.
struct TokenFields {
    std::string model;
    std::string manufacturer;
    std::string serial;
    std::string label;

    bool operator<(const TokenFields& other) const {
        return std::tie(model, manufacturer, serial, label) <
               std::tie(other.model, other.manufacturer, other.serial, other.label);
    }
};

// Spelled to the byte as p11-kit spells it, so that an identifier can be given to its tools.
std::string tokenIdentifier(const TokenFields& fields);

}  // namespace vlm::service
