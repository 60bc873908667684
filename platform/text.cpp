#include "platform/text.h"

namespace vlm::platform {

std::string hexadecimal(const Bytes& bytes) {
    constexpr std::string_view kDigits = "0123456789ABCDEF";
    std::string text;
    text.reserve(bytes.size() * 2);
    for (const std::uint8_t byte : bytes) {
        text += kDigits[byte >> 4U];
        text += kDigits[byte & 0xFU];
    }
    return text;
}

std::string toText(const Bytes& bytes) {
    std::string text = "<";
    text += hexadecimal(bytes);
    return text += '>';
}

std::string toText(const Error& error) {
    std::string text = error.domain + " error " + std::to_string(error.code);
    if (error.localizedDescription) text += ": " + *error.localizedDescription;
    return text;
}

// A value is put in as it is: a "{}" inside it is text and takes no value of its own.
std::string fillIn(std::string_view pattern, std::initializer_list<std::string> values) {
    std::string line;
    const auto* value = values.begin();
    for (; value != values.end(); ++value) {
        const std::size_t place = pattern.find("{}");
        if (place == std::string_view::npos) break;
        line += pattern.substr(0, place);
        line += *value;
        pattern.remove_prefix(place + 2);
    }
    line += pattern;
    return line;
}

}  // namespace vlm::platform
