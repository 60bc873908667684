// Random property lists of all kinds, the same for the same seed.

#pragma once

#include <bit>
#include <cstdint>
#include <random>
#include <string>
#include <string_view>

#include "platform/property_list.h"

namespace vlm::platform {

class RandomValues {
public:
    explicit RandomValues(std::uint64_t seed) : _random(seed) {}

    PropertyList next(int depth = 3) {
        switch (below(depth > 0 ? 10 : 8)) {
            case 0:
                return below(2) == 1;
            case 1:
                return anyInteger();
            case 2:
                return static_cast<std::int64_t>(anyInteger());
            case 3:
                return anyDouble();
            case 4:
                return PropertyList::Date{anyDouble()};
            case 5:
                return anyBytes();
            case 6:
            case 7:
                return anyText();
            case 8:
                return anyArray(depth - 1);
            default:
                return anyDictionary(depth - 1);
        }
    }

    std::uint64_t below(std::uint64_t limit) { return _random() % limit; }

private:
    // Of every magnitude alike; the plain numbers would nearly all need eight bytes.
    std::uint64_t anyInteger() { return _random() >> below(64); }

    double anyDouble() {
        const auto number = std::bit_cast<double>(_random());
        return number == number ? number : 0.5;  // what is no number does not equal itself
    }

    Bytes anyBytes() {
        Bytes bytes(below(20));
        for (auto& byte : bytes) byte = static_cast<std::uint8_t>(below(256));
        return bytes;
    }

    std::string anyText() {
        static constexpr std::string_view kCharacters[] = {"a",
                                                           "Z",
                                                           "0",
                                                           "\n",
                                                           "\x7F",
                                                           "\xC2\x80",
                                                           "\xE6\xB0\xB4",
                                                           "\xEF\xBF\xBF",
                                                           "\xF0\x9F\x92\xB3"};
        const std::uint64_t kinds = below(2) == 0 ? 5 : std::size(kCharacters);
        std::string text;
        for (std::uint64_t left = below(20); left > 0; --left) text += kCharacters[below(kinds)];
        return text;
    }

    PropertyList::Array anyArray(int depth) {
        PropertyList::Array array;
        for (std::uint64_t left = below(8); left > 0; --left) array.push_back(next(depth));
        return array;
    }

    PropertyList::Dictionary anyDictionary(int depth) {
        PropertyList::Dictionary dictionary;
        for (std::uint64_t left = below(8); left > 0; --left)
            dictionary.set(anyText(), next(depth));
        return dictionary;
    }

    std::mt19937_64 _random;
};

}  // namespace vlm::platform
