#include "platform/property_list.h"

#include <gtest/gtest.h>

#include <limits>

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

TEST(PropertyListTest, AnswersOnlyAsTheKindThatItIs) {
    struct {
        const char* why;
        PropertyList value;
        int kind;
    } const rows[] = {
        {"a boolean is never a number", true, 0},
        {"an integer is never a real", 1, 1},
        {"a real is never an integer", 1.0, 2},
        {"a date is never a real", Date{1}, 3},
        {"text", "1", 4},
        {"bytes are never text", Bytes{1}, 5},
        {"an array", Array{1}, 6},
        {"a dictionary", Dictionary{{"1", 1}}, 7},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(row.value.boolean().has_value(), row.kind == 0) << row.why;
        EXPECT_EQ(row.value.integer().has_value(), row.kind == 1) << row.why;
        EXPECT_EQ(row.value.unsignedInteger().has_value(), row.kind == 1) << row.why;
        EXPECT_EQ(row.value.real().has_value(), row.kind == 2) << row.why;
        EXPECT_EQ(row.value.date().has_value(), row.kind == 3) << row.why;
        EXPECT_EQ(row.value.text() != nullptr, row.kind == 4) << row.why;
        EXPECT_EQ(row.value.bytes() != nullptr, row.kind == 5) << row.why;
        EXPECT_EQ(row.value.array() != nullptr, row.kind == 6) << row.why;
        EXPECT_EQ(row.value.dictionary() != nullptr, row.kind == 7) << row.why;
    }
}

TEST(PropertyListTest, HoldsIntegersOfTheSignedAndTheUnsignedRange) {
    EXPECT_EQ(PropertyList(INT64_MIN).integer(), INT64_MIN);
    EXPECT_EQ(PropertyList(INT64_MAX).unsignedInteger(), std::uint64_t{INT64_MAX});
    EXPECT_EQ(PropertyList(UINT64_MAX).unsignedInteger(), UINT64_MAX);
    EXPECT_EQ(PropertyList(UINT64_MAX).integer(), std::nullopt);
    EXPECT_EQ(PropertyList(-1).unsignedInteger(), std::nullopt);
}

TEST(PropertyListTest, IsTheSameIntegerWhicheverTypeItCameFrom) {
    EXPECT_EQ(PropertyList(7), PropertyList(std::uint64_t{7}));
    EXPECT_EQ(PropertyList(7), PropertyList(std::int64_t{7}));
    EXPECT_NE(PropertyList(std::uint64_t{1} << 63U), PropertyList(INT64_MIN));
}

TEST(PropertyListTest, IsUnequalToAnotherKindOfTheSameLook) {
    EXPECT_NE(PropertyList(1), PropertyList(true));
    EXPECT_NE(PropertyList(1), PropertyList(1.0));
    EXPECT_NE(PropertyList(1.0), PropertyList(Date{1.0}));
    EXPECT_NE(PropertyList(Array{}), PropertyList(Dictionary{}));
}

TEST(DictionaryTest, FindsWhatWasSet) {
    const Dictionary dictionary = {{"a", 1}, {"b", "two"}};

    ASSERT_NE(dictionary.find("b"), nullptr);
    EXPECT_EQ(*dictionary.find("b"), PropertyList("two"));
    EXPECT_EQ(dictionary.find("c"), nullptr);
    EXPECT_TRUE(dictionary.contains("a"));
    EXPECT_FALSE(dictionary.contains(""));
    EXPECT_EQ(dictionary.size(), 2u);
    EXPECT_TRUE(Dictionary().empty());
}

TEST(DictionaryTest, KeepsTheOrderOfFirstSettingAndTheLastValue) {
    Dictionary dictionary;
    dictionary.set("z", 1);
    dictionary.set("a", 2);
    dictionary.set("z", 3);

    EXPECT_EQ(PropertyList(dictionary).describe(), "{\"z\": 3, \"a\": 2}");
    EXPECT_EQ(dictionary, (Dictionary{{"z", 1}, {"a", 2}, {"z", 3}}));
}

TEST(DictionaryTest, IsUnequalWhenItsOrderDiffers) {
    EXPECT_NE((Dictionary{{"a", 1}, {"b", 2}}), (Dictionary{{"b", 2}, {"a", 1}}));
}

TEST(DescribeTest, ShowsEveryKindOnOneLine) {
    struct {
        const char* why;
        PropertyList value;
        const char* line;
    } const rows[] = {
        {"true", true, "true"},
        {"false", false, "false"},
        {"a negative number", -7, "-7"},
        {"the greatest number", UINT64_MAX, "18446744073709551615"},
        {"a real, as short as it can be told", 0.1, "0.1"},
        {"a real that is no number", std::numeric_limits<double>::infinity(), "inf"},
        {"the first date", Date{0}, "2001-01-01 00:00:00 UTC"},
        {"a date before it", Date{-0.5}, "2000-12-31 23:59:59 UTC"},
        {"a leap day", Date{225981296}, "2008-02-29 12:34:56 UTC"},
        {"a date beyond the calendar", Date{1e300}, "1e+300 s since 2001"},
        {"a date that is no number", Date{std::numeric_limits<double>::quiet_NaN()},
         "nan s since 2001"},
        {"text as it is", "caf\xC3\xA9 \"x\"", "caf\xC3\xA9 \"x\""},
        {"text that would break the line", "a\nb\x1B[2J\x7F", "a\\x0Ab\\x1B[2J\\x7F"},
        {"bytes", Bytes{0xAB, 0x01}, "<AB01>"},
        {"nothing in an array", Array{}, "[]"},
        {"text inside an array stands in quotes", Array{1, "a, \"b\"", Array{true}},
         "[1, \"a, \\\"b\\\"\", [true]]"},
        {"a backslash inside an array is doubled", Array{"a\\x0Ab\n"}, "[\"a\\\\x0Ab\\x0A\"]"},
        {"empty collections inside one", Array{Array{}, Dictionary{}}, "[[], {}]"},
        {"a dictionary", Dictionary{{"k", "v"}, {"n\n", Dictionary{}}},
         "{\"k\": \"v\", \"n\\x0A\": {}}"},
    };
    for (const auto& row : rows) EXPECT_EQ(row.value.describe(), row.line) << row.why;
}

TEST(ReadPropertyListTest, AnswersNoneForAFormatThatItDoesNotKnow) {
    for (const std::string_view data : {"", "bplist", "hello", "\0\0\0\0\0\0\0\0"})
        EXPECT_FALSE(readPropertyList(Bytes(data.begin(), data.end()))) << data;
}

}  // namespace
}  // namespace vlm::platform
