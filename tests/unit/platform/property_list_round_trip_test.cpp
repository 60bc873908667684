// Whatever can be written is read back as it was; the values are random, the same in every run.

#include <gtest/gtest.h>

#include <bit>
#include <random>

#include "fuzz/properties.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

class RandomValues {
public:
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
                return Date{anyDouble()};
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

    std::mt19937_64 _random{20010101};
};

TEST(PropertyListRoundTripTest, GivesBackWhatWasWritten) {
    RandomValues values;
    for (int number = 0; number < 20000; ++number) {
        const PropertyList value = values.next();
        const auto data = writeBinaryPropertyList(value);
        ASSERT_TRUE(data) << value.describe();
        const auto again = readPropertyList(*data);
        ASSERT_EQ(again, value) << value.describe();
        ASSERT_EQ(writeBinaryPropertyList(*again), data) << value.describe();
    }
}

TEST(PropertyListRoundTripTest, HoldsForWhateverIsStillReadOfABrokenList) {
    RandomValues values;
    int stillRead = 0;
    for (int number = 0; number < 5000; ++number) {
        auto data = writeBinaryPropertyList(values.next()).value();
        for (int broken = 0; broken < 3; ++broken)
            data[values.below(data.size())] = static_cast<std::uint8_t>(values.below(256));
        if (readPropertyList(data)) ++stillRead;
        ASSERT_TRUE(fuzz::propertyListRoundTrips(data)) << "list " << number;
    }
    EXPECT_GT(stillRead, 100);
}

// So many entries that a reader or writer that compared each with each would take minutes.
constexpr int kManyEntries = 100000;

TEST(PropertyListRoundTripTest, IsQuickForALongDictionary) {
    Dictionary dictionary;
    for (int number = 0; number < kManyEntries; ++number)
        dictionary.append("key " + std::to_string(number), number);
    const PropertyList value = dictionary;

    const auto data = writeBinaryPropertyList(value);

    ASSERT_TRUE(data);
    EXPECT_TRUE(readPropertyList(*data) == value);
}

TEST(PropertyListRoundTripTest, IsQuickForALongDictionaryOfOneKey) {
    Dictionary dictionary;
    for (int number = 0; number < kManyEntries; ++number) dictionary.append("key", number);

    const auto data = writeBinaryPropertyList(dictionary);

    ASSERT_TRUE(data);
    EXPECT_EQ(readPropertyList(*data), PropertyList(Dictionary{{"key", kManyEntries - 1}}));
}

TEST(PropertyListRoundTripTest, IsQuickForALongArray) {
    Array array;
    for (int number = 0; number < kManyEntries; ++number)
        array.emplace_back("text " + std::to_string(number));
    const PropertyList value = array;

    const auto data = writeBinaryPropertyList(value);

    ASSERT_TRUE(data);
    EXPECT_TRUE(readPropertyList(*data) == value);
}

}  // namespace
}  // namespace vlm::platform
