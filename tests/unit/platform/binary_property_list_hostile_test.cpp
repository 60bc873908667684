// Input that means harm or is broken, and the limits that hold it.

#include <gtest/gtest.h>

#include "binary_list.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

constexpr std::uint64_t kHuge = UINT64_MAX;

TEST(HostilePropertyListTest, RefusesAFrameThatDoesNotHold) {
    struct {
        const char* why;
        BinaryList list;
    } const rows[] = {
        {"offsets of no bytes", {.objects = {"09"}, .offsetWidth = 0}},
        {"offsets of nine bytes", {.objects = {"09"}, .offsetWidth = 9}},
        {"references of no bytes", {.objects = {"A1 01", "09"}, .referenceWidth = 0}},
        {"references of nine bytes",
         {.objects = {"A1 00 00 00 00 00 00 00 00 01", "09"}, .referenceWidth = 9}},
        {"no objects", {.objects = {"09"}, .objectCount = 0}},
        {"one object more than offsets", {.objects = {"09"}, .objectCount = 2}},
        {"2^60 objects", {.objects = {"09"}, .objectCount = std::uint64_t{1} << 60U}},
        {"a number of objects that overflows with the width",
         {.objects = {"09"}, .offsetWidth = 8, .objectCount = (std::uint64_t{1} << 61U) + 1}},
        {"as many objects as can be said", {.objects = {"09"}, .objectCount = kHuge}},
        {"the top object behind the last", {.objects = {"09"}, .topObject = 1}},
        {"the top object anywhere", {.objects = {"09"}, .topObject = kHuge}},
        {"the table inside the magic", {.objects = {"09"}, .tableOffset = 7}},
        {"the table before the objects", {.objects = {"09"}, .tableOffset = 8}},
        {"the table at the trailer", {.objects = {"09"}, .tableOffset = 10}},
        {"the table inside the trailer", {.objects = {"09"}, .tableOffset = 11}},
        {"the table anywhere", {.objects = {"09"}, .tableOffset = kHuge}},
        {"the magic, which looks like text", {.objects = {"09"}, .offsets = {{0}}}},
        {"an object inside the magic", {.objects = {"09"}, .offsets = {{7}}}},
        {"an object inside the table", {.objects = {"09"}, .offsets = {{9}}}},
        {"an object anywhere", {.objects = {"09"}, .offsetWidth = 8, .offsets = {{kHuge}}}},
        {"no objects at all", {.objects = {}}},
    };
    for (const auto& row : rows) EXPECT_FALSE(readPropertyList(row.list.bytes())) << row.why;
}

TEST(HostilePropertyListTest, RefusesAListThatWasCut) {
    const Bytes whole = BinaryList{{"D1 01 02", "51 61", "A1 01"}}.bytes();
    ASSERT_TRUE(readPropertyList(whole));

    for (std::size_t length = 0; length < whole.size(); ++length)
        EXPECT_FALSE(readPropertyList(std::span(whole).first(length))) << length << " bytes";
}

TEST(HostilePropertyListTest, RefusesAnotherMagic) {
    const Bytes whole = BinaryList{{"09"}}.bytes();
    for (std::size_t at = 0; at < 8; ++at) {
        Bytes other = whole;
        other[at] ^= 1U;
        EXPECT_FALSE(readPropertyList(other)) << "byte " << at;
    }
}

TEST(HostilePropertyListTest, RefusesAnObjectThatIsNoValue) {
    struct {
        const char* why;
        std::string_view object;
    } const rows[] = {
        {"null", "00"},
        {"an unknown constant", "01"},
        {"a fill byte", "0F"},
        {"an integer of 32 bytes",
         "15 0000000000000000 0000000000000000 0000000000000000 0000000000000000"},
        {"an integer that is cut", "13 00 00 00 00 00 00 00"},
        {"an integer of no bytes", "10"},
        {"an integer above every range", "14 00000000 00000001 00000000 00000000"},
        {"an integer below every range", "14 FFFFFFFF FFFFFFFF 7FFFFFFF FFFFFFFF"},
        {"an integer far below", "14 80000000 00000000 80000000 00000000"},
        {"a real of one byte", "20 00"},
        {"a real of two bytes", "21 00 00"},
        {"a real of sixteen bytes", "24 00000000 00000000 00000000 00000000"},
        {"a real of four bytes that is cut", "22 00 00 00"},
        {"a real of eight bytes that is cut", "23 00 00 00 00 00 00 00"},
        {"a date of four bytes", "32 00 00 00 00 00 00 00 00"},
        {"a date of sixteen bytes", "34 00000000 00000000 00000000 00000000"},
        {"a date that is cut", "33 00 00 00 00 00 00 00"},
        {"bytes that are cut", "42 00"},
        {"text that is cut", "52 61"},
        {"UTF-16 that is cut", "62 00 61 00"},
        {"UTF-16 that is cut within a unit", "61 00"},
        {"ASCII text with another byte", "51 80"},
        {"a high surrogate at the end", "61 D8 3D"},
        {"a low surrogate alone", "61 DC B3"},
        {"surrogates the wrong way round", "62 DC B3 D8 3D"},
        {"a high surrogate before a letter", "62 D8 3D 00 61"},
        {"a kind of its own for UTF-8", "71 61"},
        {"an identifier", "80 01"},
        {"an unknown kind", "90"},
        {"an ordered set", "B0"},
        {"a set", "C0"},
        {"another unknown kind", "E0"},
        {"the last unknown kind", "F0"},
        {"a long count that is missing", "4F"},
        {"a long count that is no integer", "4F 23 00 00 00 00 00 00 00 00"},
        {"a long count that is a count", "4F 41 00"},
        {"a long count that is cut", "4F 11 00"},
        {"a long count of sixteen bytes", "4F 14 00000000 00000000 00000000 00000000"},
        {"a long count below zero", "4F 13 FF FF FF FF FF FF FF FF"},
        {"a long count of units that overflows", "6F 13 80 00 00 00 00 00 00 00"},
        {"a long count of entries that overflows", "DF 13 80 00 00 00 00 00 00 00"},
        {"a long count of elements beyond the end", "AF 12 FF FF FF FF"},
        {"an array that is cut", "A1"},
        {"a dictionary without a value", "D1 00"},
        {"a reference to what is not there", "A1 07"},
        {"a key that is not there", "D1 07 00"},
    };
    for (const auto& row : rows) {
        const BinaryList asTop = {{row.object}};
        const BinaryList asElement = {{"A1 01", row.object}};
        EXPECT_FALSE(readPropertyList(asTop.bytes())) << row.why;
        EXPECT_FALSE(readPropertyList(asElement.bytes())) << row.why << ", in an array";
    }
}

TEST(HostilePropertyListTest, RefusesKeysThatAreNoText) {
    for (const std::string_view key : {"10 01", "09", "41 61", "A0", "D0", "33 0000000000000000"})
        EXPECT_FALSE(readPropertyList(BinaryList{{"D1 01 02", key, "09"}}.bytes())) << key;
}

TEST(HostilePropertyListTest, RefusesCycles) {
    struct {
        const char* why;
        std::vector<std::string_view> objects;
    } const rows[] = {
        {"an array in itself", {"A1 00"}},
        {"an array in itself, twice", {"A2 00 00"}},
        {"a dictionary in itself", {"D1 01 00", "51 61"}},
        {"a dictionary that is its own key", {"D1 00 00"}},
        {"two arrays in each other", {"A1 01", "A1 00"}},
        {"a cycle behind good elements", {"A3 01 01 02", "09", "D1 03 00", "51 61"}},
    };
    for (const auto& row : rows)
        EXPECT_FALSE(readPropertyList(BinaryList{row.objects}.bytes())) << row.why;
}

// Arrays inside each other, so many deep, each with so many references to the next.
Bytes nestedArrays(std::size_t depth, std::size_t width) {
    Bytes list = fromHex("62 70 6C 69 73 74 30 30");
    Bytes offsets;
    for (std::size_t number = 0; number < depth; ++number) {
        appendNumber(offsets, list.size(), 4);
        const bool innermost = number + 1 == depth;
        list.push_back(static_cast<std::uint8_t>(0xA0U | (innermost ? 0 : width)));
        for (std::size_t each = 0; !innermost && each < width; ++each)
            appendNumber(list, number + 1, 2);
    }
    const std::size_t table = list.size();
    append(list, offsets);
    append(list, fromHex("00 00 00 00 00 00 04 02"));
    for (const std::uint64_t number :
         {std::uint64_t{depth}, std::uint64_t{0}, std::uint64_t{table}})
        appendNumber(list, number, 8);
    return list;
}

PropertyList nestedValue(std::size_t depth) {
    PropertyList value = Array{};
    for (std::size_t outer = 1; outer < depth; ++outer) {
        Array array;
        array.push_back(std::move(value));
        value = std::move(array);
    }
    return value;
}

TEST(PropertyListLimitsTest, AllowCollectionsAsDeepAsTheySay) {
    EXPECT_TRUE(readPropertyList(nestedArrays(512, 1)));
    EXPECT_FALSE(readPropertyList(nestedArrays(513, 1)));
    EXPECT_TRUE(writeBinaryPropertyList(nestedValue(512)));
    EXPECT_FALSE(writeBinaryPropertyList(nestedValue(513)));
    EXPECT_TRUE(readPropertyList(BinaryList{{"09"}}.bytes(), {.depth = 0}));
    EXPECT_FALSE(readPropertyList(BinaryList{{"A0"}}.bytes(), {.depth = 0}));
}

TEST(PropertyListLimitsTest, CountEveryUseOfASharedObject) {
    const Bytes list = BinaryList{{"A3 01 01 02", "A1 02", "09"}}.bytes();  // 6 values of 3 objects

    EXPECT_TRUE(readPropertyList(list, {.objects = 6}));
    EXPECT_FALSE(readPropertyList(list, {.objects = 5}));
}

TEST(PropertyListLimitsTest, CountKeysAsObjects) {
    const PropertyList value = Dictionary{{"a", "a"}};
    const Bytes list = writeBinaryPropertyList(value).value();

    EXPECT_TRUE(readPropertyList(list, {.objects = 3}));
    EXPECT_FALSE(readPropertyList(list, {.objects = 2}));
    EXPECT_TRUE(writeBinaryPropertyList(value, {.objects = 3}));
    EXPECT_FALSE(writeBinaryPropertyList(value, {.objects = 2}));
}

TEST(PropertyListLimitsTest, CountTheBytesOfTheList) {
    const Bytes list = BinaryList{{"09"}}.bytes();

    EXPECT_TRUE(readPropertyList(list, {.bytes = list.size()}));
    EXPECT_FALSE(readPropertyList(list, {.bytes = list.size() - 1}));
    EXPECT_TRUE(writeBinaryPropertyList(true, {.bytes = list.size()}));
    EXPECT_FALSE(writeBinaryPropertyList(true, {.bytes = list.size() - 1}));
}

TEST(PropertyListLimitsTest, CountTheBytesThatValuesHoldWithEveryUse) {
    struct {
        const char* why;
        PropertyList element;
    } const rows[] = {
        {"text", std::string(100, 'x')},
        {"bytes", Bytes(100, 7)},
        {"keys", Dictionary{{std::string(100, 'x'), true}}},
    };
    for (const auto& row : rows) {
        const PropertyList value = Array(10, row.element);
        const Bytes list = writeBinaryPropertyList(value).value();
        ASSERT_LT(list.size(), 1000u) << row.why;

        EXPECT_TRUE(readPropertyList(list, {.bytes = 1000})) << row.why;
        EXPECT_FALSE(readPropertyList(list, {.bytes = 999})) << row.why;
        EXPECT_TRUE(writeBinaryPropertyList(value, {.bytes = 1000})) << row.why;
        EXPECT_FALSE(writeBinaryPropertyList(value, {.bytes = 999})) << row.why;
    }
}

TEST(PropertyListLimitsTest, HoldListsThatBlowUpWhenExpanded) {
    EXPECT_FALSE(readPropertyList(nestedArrays(40, 2)));  // 2^40 values
    EXPECT_FALSE(readPropertyList(nestedArrays(500, 14)));
    EXPECT_FALSE(readPropertyList(nestedArrays(14, 2)));  // 2^14 - 1 values of 165 bytes
    EXPECT_TRUE(readPropertyList(nestedArrays(12, 2)));   // 2^12 - 1 values
}

// 600,000 references in an array whose first element is such an array again, 500 deep: what is
// set aside for one would be paid for, for all of them it would be the machine's memory.
TEST(PropertyListLimitsTest, HoldLongArraysThatLieInsideEachOther) {
    constexpr std::size_t kDepth = 500;
    constexpr std::size_t kElements = 600000;
    Bytes list = fromHex("62 70 6C 69 73 74 30 30");
    Bytes offsets;
    for (std::size_t number = 0; number < kDepth; ++number) {
        appendNumber(offsets, list.size(), 4);
        append(list, fromHex("AF 12"));
        appendNumber(list, kElements, 4);
        appendNumber(list, number + 1, 2);
    }
    appendNumber(offsets, list.size(), 4);
    list.push_back(0x09);
    list.resize(list.size() + kElements * 2);
    const std::size_t table = list.size();
    append(list, offsets);
    append(list, fromHex("00 00 00 00 00 00 04 02"));
    for (const std::size_t number : {kDepth + 1, std::size_t{0}, table})
        appendNumber(list, number, 8);

    EXPECT_FALSE(readPropertyList(list));
}

}  // namespace
}  // namespace vlm::platform
