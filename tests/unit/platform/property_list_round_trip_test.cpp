// Whatever can be written is read back as it was; the values are random, the same in every run.

#include <gtest/gtest.h>

#include "fuzz/properties.h"
#include "platform/property_list.h"
#include "round_trips.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

TEST(PropertyListRoundTripTest, GivesBackWhatWasWritten) {
    test::expectThatBinaryListsRoundTrip(20000);
}

TEST(PropertyListRoundTripTest, GivesBackWhatWasWrittenInXml) {
    test::expectThatXmlListsRoundTrip(5000);
}

TEST(PropertyListRoundTripTest, HoldsForWhateverIsStillReadOfABrokenList) {
    test::RandomPropertyLists values;
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
