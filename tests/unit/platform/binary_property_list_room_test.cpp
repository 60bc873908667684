#include "platform/binary_property_list_room.h"

#include <gtest/gtest.h>

#include "random_property_lists.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

binary_format::Room roomFor(const PropertyList& value) {
    return binary_format::roomFor(value, {}).value();
}

TEST(PropertyListRoomTest, IsNeverSmallerThanTheListOfARandomValue) {
    test::RandomPropertyLists values;
    for (int number = 0; number < 5000; ++number) {
        const PropertyList value = values.next();
        const auto list = writeBinaryPropertyList(value);
        ASSERT_TRUE(list);
        ASSERT_GE(roomFor(value).bytes(), list->size()) << value.describe();
    }
}

TEST(PropertyListRoomTest, IsNeverSmallerThanTheListWhereAWidthChanges) {
    for (const std::size_t count : {0, 1, 14, 15, 127, 128, 254, 255, 256, 65535, 65536}) {
        std::string accented;
        std::string paired;
        Dictionary dictionary;
        for (std::size_t each = 0; each < count; ++each) {
            accented += "\xC3\xA9";
            paired += "\xF0\x9F\x92\xB3";
            dictionary.append(std::to_string(each), true);
        }
        const PropertyList values[] = {Bytes(count, 7),
                                       std::string(count, 'a'),
                                       std::string(count, 'a') + "\xC3\xA9",
                                       accented,
                                       paired,
                                       Array(count, 7),
                                       Array(count, "same"),
                                       dictionary};
        for (const PropertyList& value : values) {
            const auto list = writeBinaryPropertyList(value);
            ASSERT_TRUE(list);
            EXPECT_GE(roomFor(value).bytes(), list->size()) << count;
        }
    }
}

// What is not shared, and takes what it takes, leaves nothing over.
TEST(PropertyListRoomTest, IsExactWhereNothingIsSaved) {
    const PropertyList values[] = {
        true,
        -1,
        UINT64_MAX,
        1.5,
        Date{1},
        "text",
        Bytes(300, 7),
        Array{1, 256, 65536, "a", Bytes{1}, true},
        Dictionary{{"key", 1}, {"other", Array{}}},
    };
    for (const PropertyList& value : values)
        EXPECT_EQ(roomFor(value).bytes(), writeBinaryPropertyList(value)->size())
            << value.describe();
}

TEST(PropertyListRoomTest, CountsWhatThereIs) {
    const auto room = roomFor(Dictionary{{"a", Array{1, "b", Bytes{1}}}, {"c", true}});

    EXPECT_EQ(room.scalars, 6u);
    EXPECT_EQ(room.hashes.size(), 4u);
    EXPECT_EQ(room.collections, 2u);
    EXPECT_EQ(room.references, 7u);
    EXPECT_EQ(room.objects(), 8u);
}

TEST(PropertyListRoomTest, IsNumberableWhile32BitsHoldEveryNumberAndOffset) {
    const std::size_t most = 0xFFFFFFFF;

    EXPECT_TRUE((binary_format::Room{.scalars = 1}.isNumberable()));
    EXPECT_TRUE((binary_format::Room{.contents = most / 2}.isNumberable()));
    EXPECT_FALSE((binary_format::Room{.contents = most}.isNumberable()));
    EXPECT_FALSE((binary_format::Room{.scalars = most}.isNumberable()));
}

TEST(PropertyListRoomTest, IsNotGivenBeyondTheLimits) {
    EXPECT_FALSE(binary_format::roomFor(Array{Array{}}, {.depth = 1}));
    EXPECT_FALSE(binary_format::roomFor(Array{1, 2}, {.objects = 2}));
    EXPECT_FALSE(binary_format::roomFor("four", {.bytes = 3}));
    EXPECT_TRUE(binary_format::roomFor(Array{"four", 2}, {.depth = 1, .objects = 3, .bytes = 4}));
}

}  // namespace
}  // namespace vlm::platform
