// What is found again among the parts of a list, and what happens when their hashes are chosen.

#include "platform/property_list_index.h"

#include <gtest/gtest.h>

#include <string>

#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

// So many keys that begin at one place in every table of so many places or fewer.
std::vector<std::string> collidingKeys(std::size_t count, std::uint32_t places) {
    std::vector<std::string> keys;
    for (int number = 0; keys.size() < count; ++number) {
        std::string key = "key " + std::to_string(number);
        if (hashOf(key) % places == 0) keys.push_back(std::move(key));
    }
    return keys;
}

TEST(PropertyListIndexTest, FindsWhatWasAdded) {
    PropertyListIndex index;
    const auto find = [&](std::uint32_t number, std::uint32_t next) {
        return index.findOrAdd(hashOf(std::uint64_t{number}), next,
                               [&](std::uint32_t other) { return other == number; });
    };
    for (std::uint32_t number = 0; number < 10000; ++number)
        ASSERT_EQ(find(number, number), number);

    for (std::uint32_t number = 0; number < 10000; ++number) ASSERT_EQ(find(number, 77777), number);
}

TEST(PropertyListIndexTest, TellsPartsOfOneHashApart) {
    PropertyListIndex index;

    EXPECT_EQ(index.findOrAdd(5, 0, [](std::uint32_t) { return false; }), 0u);
    EXPECT_EQ(index.findOrAdd(5, 1, [](std::uint32_t) { return false; }), 1u);
    EXPECT_EQ(index.findOrAdd(5, 2, [](std::uint32_t other) { return other == 1; }), 1u);
}

TEST(PropertyListIndexTest, GivesUpWhenTooManyAreInTheWay) {
    PropertyListIndex index;
    for (std::uint32_t number = 0; number < 128; ++number)
        ASSERT_EQ(index.findOrAdd(5, number, [](std::uint32_t) { return false; }), number);

    EXPECT_EQ(index.findOrAdd(5, 128, [](std::uint32_t) { return false; }), std::nullopt);
    EXPECT_EQ(index.findOrAdd(5, 128, [](std::uint32_t other) { return other == 9; }), 9u);
}

TEST(HashTest, DiffersWithEveryByte) {
    for (std::size_t size = 1; size < 40; ++size) {
        const std::string text(size, 'a');
        for (std::size_t at = 0; at < size; ++at) {
            std::string other = text;
            other[at] = 'b';
            EXPECT_NE(hashOf(text), hashOf(other)) << size << " bytes, the one at " << at;
        }
        EXPECT_NE(hashOf(text), hashOf(text + "a")) << size;
    }
}

// 200 keys make a table of 512 places.
TEST(ChosenHashesTest, LeaveTheLastValueToEveryKey) {
    const auto keys = collidingKeys(199, 512);
    std::string text = "{";
    Dictionary expected;
    for (const auto& key : keys) {
        text += "\"" + key + "\" = 1;";
        expected.append(key, key == keys[150] ? "2" : "1");
    }
    text += "\"" + keys[150] + "\" = 2; }";

    EXPECT_EQ(readPropertyList(Bytes(text.begin(), text.end())), PropertyList(expected));
}

TEST(ChosenHashesTest, LeaveALongListWhole) {
    const auto keys = collidingKeys(300, 1024);
    Array array;
    for (int time = 0; time < 2; ++time)
        for (const auto& key : keys) array.emplace_back(key);
    const PropertyList value = array;

    const auto data = writeBinaryPropertyList(value);

    ASSERT_TRUE(data);
    EXPECT_EQ(readPropertyList(*data), value);
}

}  // namespace
}  // namespace vlm::platform
