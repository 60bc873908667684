// Values to write and to read back: random, and the same in every run.

#pragma once

#include <bit>
#include <cstdint>
#include <iterator>
#include <random>
#include <string>
#include <string_view>

#include "platform/property_list.h"

namespace vlm::test {

class RandomPropertyLists {
public:
    // Those that XML has a form for have no other dates than whole seconds, nor control characters.
    enum class Of { Anything, WhatXmlHolds };

    explicit RandomPropertyLists(Of kind = Of::Anything) : _isForXml(kind == Of::WhatXmlHolds) {}

    using Array = platform::PropertyList::Array;
    using Bytes = platform::Bytes;
    using Date = platform::PropertyList::Date;
    using Dictionary = platform::PropertyList::Dictionary;

    platform::PropertyList next(int depth = 3) {
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
                return anyDate();
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

    Date anyDate() {
        if (!_isForXml) return Date{anyDouble()};
        constexpr std::int64_t kFirst = -63113904000;  // of the year 1
        constexpr std::int64_t kEnd = 252423993600;    // of the year 9999
        return Date{static_cast<double>(kFirst + static_cast<std::int64_t>(below(kEnd - kFirst)))};
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
                                                           "&",
                                                           "<",
                                                           "\r",
                                                           "\x7F",
                                                           "\xC2\x80",
                                                           "\xE6\xB0\xB4",
                                                           "\xF0\x9F\x92\xB3",
                                                           "\x01",
                                                           "\xEF\xBF\xBF"};
        const std::uint64_t all = std::size(kCharacters) - (_isForXml ? 2 : 0);
        const std::uint64_t kinds = below(2) == 0 ? 8 : all;
        std::string text;
        for (std::uint64_t left = below(20); left > 0; --left) text += kCharacters[below(kinds)];
        return text;
    }

    Array anyArray(int depth) {
        Array array;
        for (std::uint64_t left = below(8); left > 0; --left) array.push_back(next(depth));
        return array;
    }

    Dictionary anyDictionary(int depth) {
        Dictionary dictionary;
        for (std::uint64_t left = below(8); left > 0; --left)
            dictionary.set(anyText(), next(depth));
        return dictionary;
    }

    bool _isForXml;
    std::mt19937_64 _random{20010101};
};

}  // namespace vlm::test
