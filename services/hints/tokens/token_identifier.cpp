#include "services/hints/tokens/token_identifier.h"

namespace vlm::service {
namespace {

void appendField(std::string& identifier, std::string_view name, std::string_view value) {
    constexpr std::string_view kVerbatim =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789_-.";
    constexpr char kDigits[] = "0123456789ABCDEF";
    while (value.ends_with(' ')) value.remove_suffix(1);
    identifier += name;
    for (const char c : value) {
        const auto byte = static_cast<unsigned char>(c);
        if (kVerbatim.find(c) != std::string_view::npos)
            identifier += c;
        else
            identifier += {'%', kDigits[byte >> 4U], kDigits[byte & 15U]};
    }
}

}  // namespace

std::string tokenIdentifier(const TokenFields& fields) {
    std::string identifier;
    appendField(identifier, "pkcs11:model=", fields.model);
    appendField(identifier, ";manufacturer=", fields.manufacturer);
    appendField(identifier, ";serial=", fields.serial);
    appendField(identifier, ";token=", fields.label);
    return identifier;
}

}  // namespace vlm::service
