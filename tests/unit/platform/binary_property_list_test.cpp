// The binary format, byte for byte.

#include <gtest/gtest.h>

#include <limits>

#include "binary_list.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

TEST(BinaryPropertyListTest, IsMagicObjectsOffsetsAndTrailer) {
    const Bytes whole = fromHex(
        "62 70 6C 69 73 74 30 30"  // bplist00
        "51 61"                    // 8: number 1, a
        "09"                       // 10: number 2, true
        "D1 01 02"                 // 11: number 0, one entry, key 1, value 2
        "0B 08 0A"                 // 14: where they are
        "00 00 00 00 00 00"        // unused
        "01 01"                    // widths of offsets and of references
        "00 00 00 00 00 00 00 03"  // how many objects
        "00 00 00 00 00 00 00 00"  // the top one
        "00 00 00 00 00 00 00 0E"  // where the offsets are
    );
    const PropertyList value = Dictionary{{"a", true}};

    EXPECT_EQ(writeBinaryPropertyList(value), whole);
    EXPECT_EQ(readPropertyList(whole), value);
}

struct Example {
    const char* why;
    PropertyList value;
    std::vector<std::string_view> objects;   // in the order in which they lie
    std::vector<std::size_t> numbers = {0};  // theirs
};

const Example kScalars[] = {
    {"false", false, {"08"}},
    {"true", true, {"09"}},
    {"zero", 0, {"10 00"}},
    {"the greatest of one byte", 0xFF, {"10 FF"}},
    {"the least of two bytes", 0x100, {"11 01 00"}},
    {"the greatest of two bytes", 0xFFFF, {"11 FF FF"}},
    {"the least of four bytes", 0x10000, {"12 00 01 00 00"}},
    {"the greatest of four bytes", std::int64_t{0xFFFFFFFF}, {"12 FF FF FF FF"}},
    {"the least that needs eight bytes", std::int64_t{0x100000000}, {"13 00 00 00 01 00 00 00 00"}},
    {"the greatest signed one", INT64_MAX, {"13 7F FF FF FF FF FF FF FF"}},
    {"negative ones take eight bytes", -1, {"13 FF FF FF FF FF FF FF FF"}},
    {"the least signed one", INT64_MIN, {"13 80 00 00 00 00 00 00 00"}},
    {"above the signed range",
     std::uint64_t{1} << 63U,
     {"14 00 00 00 00 00 00 00 00 80 00 00 00 00 00 00 00"}},
    {"the greatest of all", UINT64_MAX, {"14 00 00 00 00 00 00 00 00 FF FF FF FF FF FF FF FF"}},
    {"a real", 1.5, {"23 3F F8 00 00 00 00 00 00"}},
    {"a real keeps the sign of zero", -0.0, {"23 80 00 00 00 00 00 00 00"}},
    {"a real without end", std::numeric_limits<double>::infinity(), {"23 7F F0 00 00 00 00 00 00"}},
    {"the first date", Date{0}, {"33 00 00 00 00 00 00 00 00"}},
    {"a date before it", Date{-1}, {"33 BF F0 00 00 00 00 00 00"}},
    {"no bytes", Bytes{}, {"40"}},
    {"one byte", Bytes{0xAB}, {"41 AB"}},
    {"as many bytes as a marker can count", Bytes(14, 7), {"4E 07070707070707070707070707 07"}},
    {"one byte more", Bytes(15, 7), {"4F 10 0F 07070707070707070707070707 0707"}},
    {"no text", "", {"50"}},
    {"ASCII text", "Az~", {"53 41 7A 7E"}},
    {"a zero byte is a character", std::string(1, '\0'), {"51 00"}},
    {"a long ASCII text",
     "0123456789ABCDE",
     {"5F 10 0F 30 31 32 33 34 35 36 37 38 39 41 42 43 44 45"}},
    {"the last ASCII character", "\x7F", {"51 7F"}},
    {"the first character that is not ASCII", "\xC2\x80", {"61 00 80"}},
    {"one such character makes all of them two bytes", "a\xC3\xA9", {"62 00 61 00 E9"}},
    {"a pair of surrogates counts as two", "\xF0\x9F\x92\xB3", {"62 D8 3D DC B3"}},
};

// Scalars lie in front, so that how wide a reference is need not be known until all are there.
const Example kCollections[] = {
    {"an empty array", Array{}, {"A0"}},
    {"one element", Array{1}, {"10 01", "A1 01"}, {1, 0}},
    {"an empty dictionary", Dictionary{}, {"D0"}},
    {"one entry", Dictionary{{"a", 1}}, {"51 61", "10 01", "D1 01 02"}, {1, 2, 0}},
    {"entries keep their order, all keys before all values",
     Dictionary{{"b", 1}, {"a", 2}},
     {"51 62", "51 61", "10 01", "10 02", "D2 01 02 03 04"},
     {1, 2, 3, 4, 0}},
    {"equal texts, bytes and booleans are one object",
     Array{"x", "x", true, true, Bytes{1}, Bytes{1}, false, false},
     {"51 78", "09", "41 01", "08", "A8 01 01 02 02 03 03 04 04"},
     {1, 2, 3, 4, 0}},
    {"equal numbers and dates are objects of their own",
     Array{1, 1, 2.5, 2.5, Date{0}, Date{0}},
     {"10 01", "10 01", "23 40 04 00 00 00 00 00 00", "23 40 04 00 00 00 00 00 00",
      "33 00 00 00 00 00 00 00 00", "33 00 00 00 00 00 00 00 00", "A6 01 02 03 04 05 06"},
     {1, 2, 3, 4, 5, 6, 0}},
    {"scalars of different kinds are never one",
     Array{1, true, "1", Bytes{'1'}, Date{0}, 0.0},
     {"10 01", "09", "51 31", "41 31", "33 00 00 00 00 00 00 00 00", "23 00 00 00 00 00 00 00 00",
      "A6 01 02 03 04 05 06"},
     {1, 2, 3, 4, 5, 6, 0}},
    {"a key shares its object with an equal value",
     Dictionary{{"a", "a"}},
     {"51 61", "D1 01 01"},
     {1, 0}},
    {"equal collections are objects of their own",
     Array{Array{}, Array{}},
     {"A2 01 02", "A0", "A0"},
     {0, 1, 2}},
    {"contents are numbered behind what holds them",
     Dictionary{{"k", Array{true}}, {"l", false}},
     {"51 6B", "51 6C", "09", "08", "D2 01 02 03 05", "A1 04"},
     {1, 2, 4, 5, 0, 3}},
    {"fifteen elements need a long count",
     Array(15, true),
     {"09", "AF 10 0F 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01"},
     {1, 0}},
};

void expectBothWays(const Example& example) {
    const Bytes expected =
        BinaryList{.objects = example.objects, .numbers = example.numbers}.bytes();

    EXPECT_EQ(writeBinaryPropertyList(example.value), expected) << example.why;
    EXPECT_EQ(readPropertyList(expected), example.value) << example.why;
}

TEST(BinaryPropertyListTest, WritesAndReadsEveryScalarInItsSmallestForm) {
    for (const auto& example : kScalars) expectBothWays(example);
}

TEST(BinaryPropertyListTest, WritesAndReadsCollections) {
    for (const auto& example : kCollections) expectBothWays(example);
}

TEST(BinaryPropertyListTest, CountsEntriesOfALongDictionary) {
    Dictionary dictionary;
    for (char letter = 'a'; letter < 'a' + 15; ++letter)
        dictionary.append(std::string(1, letter), true);
    constexpr std::string_view entries =
        "DF 10 0F 01 02 03 04 05 06 07 08 09 0A 0B 0C 0D 0E 0F"
        "10 10 10 10 10 10 10 10 10 10 10 10 10 10 10";
    expectBothWays({"fifteen entries, one value",
                    dictionary,
                    {"51 61", "51 62", "51 63", "51 64", "51 65", "51 66", "51 67", "51 68",
                     "51 69", "51 6A", "51 6B", "51 6C", "51 6D", "51 6E", "51 6F", "09", entries},
                    {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 0}});
}

// An array of so many different numbers, each of them an object of three bytes or less.
Array differentNumbers(std::size_t count) {
    Array array;
    for (std::size_t number = 0; number < count; ++number)
        array.emplace_back(std::uint64_t{number});
    return array;
}

TEST(BinaryPropertyListTest, WidensReferencesAndOffsetsWithTheList) {
    struct {
        const char* why;
        PropertyList value;
        int offsetWidth;
        int referenceWidth;
    } const rows[] = {
        {"a table at 255", Bytes(244, 7), 1, 1},
        {"a table at 256", Bytes(245, 7), 2, 1},
        {"255 objects", differentNumbers(254), 2, 1},
        {"256 objects", differentNumbers(255), 2, 2},
        {"a table at 65535", Bytes(65523, 7), 2, 1},
        {"a table at 65536", Bytes(65524, 7), 4, 1},
        {"65535 objects", differentNumbers(65534), 4, 2},
        {"65536 objects", differentNumbers(65535), 4, 4},
    };
    for (const auto& row : rows) {
        const auto data = writeBinaryPropertyList(row.value);
        ASSERT_TRUE(data) << row.why;
        EXPECT_EQ((*data)[data->size() - 26], row.offsetWidth) << row.why;
        EXPECT_EQ((*data)[data->size() - 25], row.referenceWidth) << row.why;
        EXPECT_EQ(readPropertyList(*data), row.value) << row.why;
    }
}

TEST(BinaryPropertyListTest, WritesLongCountsInTheirSmallestWidth) {
    const auto countObject = [](std::size_t size) {
        const Bytes data = writeBinaryPropertyList(Bytes(size, 7)).value();
        return Bytes(data.begin() + 8, data.begin() + 14);
    };

    EXPECT_EQ(countObject(255), fromHex("4F 10 FF 07 07 07"));
    EXPECT_EQ(countObject(256), fromHex("4F 11 01 00 07 07"));
    EXPECT_EQ(countObject(65536), fromHex("4F 12 00 01 00 00"));
}

TEST(BinaryPropertyListTest, ReadsWhatOtherWritersMayWrite) {
    struct {
        const char* why;
        BinaryList list;
        PropertyList value;
    } const rows[] = {
        {"zero in eight bytes", {{"13 00 00 00 00 00 00 00 00"}}, 0},
        {"four bytes are unsigned", {{"12 FF FF FF FF"}}, std::int64_t{0xFFFFFFFF}},
        {"a small number in sixteen bytes",
         {{"14 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 07"}},
         7},
        {"a negative number in sixteen bytes",
         {{"14 FF FF FF FF FF FF FF FF FF FF FF FF FF FF FF F9"}},
         -7},
        {"a real of four bytes", {{"22 3F C0 00 00"}}, 1.5},
        {"ASCII text in two bytes a character", {{"62 00 61 00 62"}}, "ab"},
        {"a long count of a short thing", {{"5F 10 01 61"}}, "a"},
        {"a count of eight bytes", {{"4F 13 00 00 00 00 00 00 00 01 AB"}}, Bytes{0xAB}},
        {"offsets of three bytes", {.objects = {"A1 01", "09"}, .offsetWidth = 3}, Array{true}},
        {"offsets of eight bytes", {.objects = {"A1 01", "09"}, .offsetWidth = 8}, Array{true}},
        {"references of three bytes",
         {.objects = {"A1 00 00 01", "09"}, .referenceWidth = 3},
         Array{true}},
        {"references of eight bytes",
         {.objects = {"D1 00 00 00 00 00 00 00 01 00 00 00 00 00 00 00 02", "51 61", "09"},
          .referenceWidth = 8},
         Dictionary{{"a", true}}},
        {"the top object at the end", {.objects = {"09", "A1 00"}, .topObject = 1}, Array{true}},
        {"objects that nobody refers to", {{"09", "00", "51"}}, true},
        {"objects in any order, with gaps",
         {.objects = {"FF FF FF 09 A1 01"}, .offsets = {{12, 11}}, .objectCount = 2},
         Array{true}},
        {"a collection that is used twice",
         {{"A2 01 01", "A1 02", "09"}},
         Array{Array{true}, Array{true}}},
    };
    for (const auto& row : rows)
        EXPECT_EQ(readPropertyList(row.list.bytes()), row.value) << row.why;
}

TEST(BinaryPropertyListTest, TakesTheLastValueOfAKeyThatComesAgain) {
    const BinaryList noneTwice = {
        {"D3 01 02 03 04 05 06", "51 7A", "51 61", "62 00 7A 00 7A", "10 01", "10 02", "10 03"}};
    const BinaryList often = {{"D5 01 02 01 03 01 04 05 06 05 07", "51 7A", "51 61", "51 62",
                               "10 01", "10 02", "10 03", "10 04"}};
    const BinaryList inTwoForms = {{"D2 01 02 03 04", "51 7A", "61 00 7A", "10 01", "10 02"}};

    EXPECT_EQ(readPropertyList(noneTwice.bytes()),
              PropertyList(Dictionary{{"z", 1}, {"a", 2}, {"zz", 3}}));
    EXPECT_EQ(readPropertyList(often.bytes()),
              PropertyList(Dictionary{{"z", 4}, {"a", 2}, {"b", 2}}));
    EXPECT_EQ(readPropertyList(inTwoForms.bytes()), PropertyList(Dictionary{{"z", 2}}));
}

TEST(BinaryPropertyListTest, RefusesToWriteTextThatIsNotUtf8) {
    EXPECT_FALSE(writeBinaryPropertyList("\xFF"));
    EXPECT_FALSE(writeBinaryPropertyList(Array{1, "a\xC3"}));
    EXPECT_FALSE(writeBinaryPropertyList(Dictionary{{"\xED\xA0\xBD", 1}}));
    EXPECT_FALSE(writeBinaryPropertyList(Dictionary{{"a", Dictionary{{"b", "\xC0\x80"}}}}));
}

}  // namespace
}  // namespace vlm::platform
