// Which format a list is taken for, and what is said of a binary one.

#include <gtest/gtest.h>

#include "binary_list.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

TEST(ExaminePropertyListTest, KnowsTheFormatsByHowTheyBegin) {
    constexpr auto kBinary = PropertyListFormat::Binary;
    constexpr auto kXml = PropertyListFormat::Xml;
    constexpr auto kText = PropertyListFormat::Text;
    struct {
        const char* why;
        Bytes data;
        PropertyListFormat format;
    } const rows[] = {
        {"the magic", fromHex("62 70 6C 69 73 74 30 30"), kBinary},
        {"another version of it is text", fromHex("62 70 6C 69 73 74 31 30"), kText},
        {"half of the magic is text", fromHex("62 70 6C 69"), kText},
        {"nothing", {}, kText},
        {"<?xml", fromHex("3C 3F 78 6D 6C"), kXml},
        {"<!DOCTYPE", fromHex("3C 21 44 4F 43"), kXml},
        {"<plist", fromHex("3C 70 6C 69 73 74"), kXml},
        {"<dict", fromHex("3C 64 69 63 74 3E"), kXml},
        {"<data", fromHex("3C 64 61 74 61 3E"), kXml},
        {"blanks before it", fromHex("0A 09 0D 20 3C 3F"), kXml},
        {"a mark before it", fromHex("EF BB BF 20 3C 3F"), kXml},
        {"UTF-16 in one order", fromHex("FE FF 00 3C 00 3F"), kXml},
        {"UTF-16 in the other", fromHex("FF FE 3C 00 3F 00"), kXml},
        {"<dead>, which is data", fromHex("3C 64 65 61 64 3E"), kText},
        {"<ab pq, which is data that is wrong", fromHex("3C 61 62 20 70 71"), kText},
        {"<0fz", fromHex("3C 30 66 7A"), kText},
        {"< alone", fromHex("3C"), kText},
        {"<abc without an end", fromHex("3C 61 62 63"), kText},
        {"a brace", fromHex("7B"), kText},
        {"something else", fromHex("00 FF"), kText},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(examinePropertyList(row.data).format, row.format) << row.why;
        EXPECT_EQ(examinePropertyList(row.data, {.bytes = 0}).format,
                  row.data.empty() ? kText : row.format)
            << row.why << ", too long";
    }
}

TEST(ExaminePropertyListTest, RefusesWhatIsTooLong) {
    const std::string_view text = "( abc )";

    const auto found = examinePropertyList(Bytes(text.begin(), text.end()), {.bytes = 6});

    EXPECT_FALSE(found.value);
    EXPECT_EQ(found.problem, "It is longer than 6 bytes.");
    EXPECT_EQ(found.line, 1u);
    EXPECT_EQ(found.column, 1u);
    EXPECT_EQ(examinePropertyList(BinaryList{{"09"}}.bytes(), {.bytes = 6}).line, 0u);
}

TEST(ExaminePropertyListTest, TellsWhatIsWrongWithABinaryList) {
    constexpr std::uint64_t kHuge = UINT64_MAX;
    struct {
        BinaryList list;
        const char* problem;
        PropertyListLimits limits = {};
    } const rows[] = {
        {{.objects = {"09"}, .offsetWidth = 0}, "The trailer gives no width of offsets."},
        {{.objects = {"09"}, .referenceWidth = 9}, "The trailer gives no width of references."},
        {{.objects = {"09"}, .tableOffset = kHuge}, "The trailer points beyond the data."},
        {{.objects = {"09"}, .objectCount = 2},
         "The trailer counts more objects than there are offsets."},
        {{.objects = {"09"}, .topObject = 1},
         "Object 1 is referred to, and there are not so many."},
        {{.objects = {"A1 07"}}, "Object 7 is referred to, and there are not so many."},
        {{.objects = {"09"}, .offsets = {{0}}}, "Object 0 lies outside of the objects."},
        {{.objects = {"A1 01", "00"}}, "Object 1 is a constant, and is malformed or cut."},
        {{.objects = {"A1 01", "15"}}, "Object 1 is an integer, and is malformed or cut."},
        {{.objects = {"A1 01", "20"}}, "Object 1 is a real number, and is malformed or cut."},
        {{.objects = {"A1 01", "30"}}, "Object 1 is a date, and is malformed or cut."},
        {{.objects = {"A1 01", "42"}}, "Object 1 is data, and is malformed or cut."},
        {{.objects = {"A1 01", "51 80"}}, "Object 1 is ASCII text, and is malformed or cut."},
        {{.objects = {"A1 01", "61 DC B3"}}, "Object 1 is UTF-16 text, and is malformed or cut."},
        {{.objects = {"A1 01", "A5"}}, "Object 1 is an array, and is malformed or cut."},
        {{.objects = {"A1 01", "DF"}}, "Object 1 is a dictionary, and is malformed or cut."},
        {{.objects = {"A1 01", "90"}}, "Object 1 is of an unknown kind, and is malformed or cut."},
        {{.objects = {"D1 01 02", "09", "08"}}, "Object 1 is a key, and not well-formed text."},
        {{.objects = {"A1 00"}}, "Arrays and dictionaries lie too deep inside each other."},
        {{.objects = {"A1 01", "09"}}, "There are more values than are read.", {.objects = 1}},
        {{.objects = {"09"}}, "There are more values than are read.", {.objects = 0}},
        {{.objects = {"AF 10 14 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01",
                      "47 01 02 03 04 05 06 07"}},
         "There is more text and data than is read.",
         {.bytes = 100}},
        {{.objects = {"AF 10 14 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01 01",
                      "57 41 41 41 41 41 41 41"}},
         "There is more text and data than is read.",
         {.bytes = 100}},
    };
    for (const auto& row : rows) {
        const auto found = examinePropertyList(row.list.bytes(), row.limits);
        EXPECT_FALSE(found.value) << row.problem;
        EXPECT_EQ(found.format, PropertyListFormat::Binary) << row.problem;
        EXPECT_EQ(found.problem, row.problem);
        EXPECT_EQ(found.line, 0u) << row.problem;
        EXPECT_EQ(found.column, 0u) << row.problem;
    }
    EXPECT_EQ(examinePropertyList(fromHex("62 70 6C 69 73 74 30 30")).problem,
              "It is too short for a binary property list.");
}

TEST(ExaminePropertyListTest, HasNoProblemWithAListThatIsRead) {
    const auto found = examinePropertyList(BinaryList{{"09"}}.bytes());

    EXPECT_EQ(found.value, PropertyList(true));
    EXPECT_EQ(found.problem, "");
}

}  // namespace
}  // namespace vlm::platform
