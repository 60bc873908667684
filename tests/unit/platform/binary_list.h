// Binary property lists put together by hand, well formed or not.

#pragma once

#include <cctype>
#include <optional>
#include <string_view>
#include <vector>

#include "platform/types.h"

namespace vlm::platform {

// The bytes that pairs of hexadecimal digits stand for; blanks between them do not count.
inline Bytes fromHex(std::string_view text) {
    Bytes bytes;
    std::optional<unsigned> upper;
    for (const char digit : text) {
        if (digit == ' ') continue;
        const unsigned value = std::isdigit(static_cast<unsigned char>(digit))
                                   ? static_cast<unsigned>(digit - '0')
                                   : static_cast<unsigned>(digit - 'A' + 10);
        if (upper) bytes.push_back(static_cast<std::uint8_t>(*upper << 4U | value));
        upper = upper ? std::nullopt : std::optional(value);
    }
    return bytes;
}

inline void append(Bytes& bytes, const Bytes& more) {
    bytes.insert(bytes.end(), more.begin(), more.end());
}

inline void appendNumber(Bytes& bytes, std::uint64_t number, std::size_t width) {
    for (std::size_t byte = width; byte-- > 0;)
        bytes.push_back(byte < 8 ? static_cast<std::uint8_t>(number >> (byte * 8)) : 0);
}

// A list of the objects given in hexadecimal, in the order in which they lie. What is not set is
// made to fit them.
struct BinaryList {
    std::vector<std::string_view> objects;
    std::uint64_t topObject = 0;
    std::uint8_t offsetWidth = 1;
    std::uint8_t referenceWidth = 1;
    std::optional<std::vector<std::uint64_t>> offsets = {};  // by number
    std::vector<std::size_t> numbers = {};  // of the objects; none: they are numbered as they lie
    std::optional<std::uint64_t> objectCount = {};
    std::optional<std::uint64_t> tableOffset = {};

    Bytes bytes() const {
        Bytes list = fromHex("62 70 6C 69 73 74 30 30");
        std::vector<std::uint64_t> places(objects.size());
        for (std::size_t at = 0; at < objects.size(); ++at) {
            places.at(numbers.empty() ? at : numbers.at(at)) = list.size();
            append(list, fromHex(objects[at]));
        }
        const std::uint64_t table = list.size();
        for (const std::uint64_t offset : offsets.value_or(places))
            appendNumber(list, offset, offsetWidth);
        append(list, fromHex("00 00 00 00 00 00"));
        list.push_back(offsetWidth);
        list.push_back(referenceWidth);
        appendNumber(list, objectCount.value_or(objects.size()), 8);
        appendNumber(list, topObject, 8);
        appendNumber(list, tableOffset.value_or(table), 8);
        return list;
    }
};

}  // namespace vlm::platform
