#include <gtest/gtest.h>

#include <cstdlib>
#include <random>
#include <string>

#include "util/bind_utils.h"

namespace vlm {
namespace {

using platform::Bytes;
using namespace std::string_literals;

TEST(DataToHex, PrintsTwoUpperCaseDigitsForEachByte) {
    EXPECT_EQ(BindUtils::dataToHex(Bytes{0x00, 0xAB, 0x0F}), "00AB0F");
}

TEST(DataToHex, OfEmptyDataIsTheEmptyText) { EXPECT_EQ(BindUtils::dataToHex(Bytes{}), ""); }

TEST(DataToHex, OfNoDataIsNoText) { EXPECT_EQ(BindUtils::dataToHex(std::nullopt), std::nullopt); }

TEST(DataFromHex, OfNoTextIsNoData) {
    EXPECT_EQ(BindUtils::dataFromHex(std::nullopt), std::nullopt);
}

TEST(DataFromHex, OfBytesThatAreNoTextIsNoData) {
    EXPECT_EQ(BindUtils::dataFromHex("AB\xFF"), std::nullopt);
}

struct HexRow {
    std::string text;
    Bytes data;
    const char* why;
};

TEST(DataFromHex, ReadsEachPairAsTheCLibraryReadsANumber) {
    const HexRow rows[] = {
        {"00ab0f", {0x00, 0xAB, 0x0F}, "lower case"},
        {"00AB0F", {0x00, 0xAB, 0x0F}, "upper case"},
        {"00 AB 0F", {0x00, 0xAB, 0x0F}, "spaces are removed"},
        {" 0 0A B0F  ", {0x00, 0xAB, 0x0F}, "spaces anywhere, within pairs too"},
        {"ABC", {0xAB}, "a last digit without a partner is dropped"},
        {"A", {}, "a single character"},
        {" A ", {}, "a single character among spaces"},
        {"", {}, "the empty text"},
        {"0x12", {0x00, 0x12}, "the pair 0x reads as 0"},
        {"0X12", {0x00, 0x12}, "the pair 0X reads as 0"},
        {"G1", {0x00}, "a bad first character"},
        {"1G", {0x01}, "a bad second character leaves the first digit"},
        {"-5", {0xFB}, "a sign; the low byte of the number counts"},
        {"+5", {0x05}, "a sign"},
        {"+-", {0x00}, "a second sign is no digit"},
        {"-0", {0x00}, "minus nothing"},
        {"5-", {0x05}, "a sign behind the number"},
        {"\t5", {0x05}, "a tab is white space for the number, and is not removed"},
        {"\n5\v6\f7\r8", {0x05, 0x06, 0x07, 0x08}, "all kinds of white space"},
        {"5\t", {0x05}, "white space behind the digit ends the number"},
        {"\t\n", {0x00}, "white space alone"},
        {"\t-", {0x00}, "white space and a sign alone"},
        {"A:B:", {0x0A, 0x0B}, "colons stay and end a number"},
        {":A:B", {0x00, 0x00}, "colons stay and come before any digit"},
        {"xx", {0x00}, "no digits at all"},
        {"@`", {0x00}, "just below the letters"},
        {"/:", {0x00}, "on either side of the digits"},
        {"9A", {0x9A}, "the ends of the ranges"},
        {"fF", {0xFF}, "mixed case"},
        {"a\xC4\xB1", {0xA1}, "U+0131 is cut down to 0x31, the digit 1"},
        {"\xE2\x84\xB0"
         "1",
         {0x01},
         "U+2130 is cut down to 0x30, the digit 0"},
        {"\xC4\xA0"
         "5",
         {0x05},
         "U+0120 is cut down to a space after the spaces were removed"},
        {"\xC4\x80"
         "5",
         {0x00},
         "U+0100 is cut down to the zero that ends the text"},
        {"5\xC4\x80", {0x05}, "a cut-down zero ends the number"},
        {"\0"
         "5"s,
         {0x00},
         "a zero character ends the text"},
        {"\xC2\xA0"
         "5",
         {0x00},
         "a no-break space is no white space here"},
        {"\xF0\x9C\xB0\xB1", {0x31}, "U+1CC31 is D833 DC31: 0x33 and 0x31, the digits 3 and 1"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        EXPECT_EQ(BindUtils::dataFromHex(row.text), row.data) << row.text;
    }
}

// A character up to U+00FF as UTF-8.
std::string character(unsigned code) {
    if (code < 0x80) return {static_cast<char>(code)};
    return {static_cast<char>(0xC0U | code >> 6U), static_cast<char>(0x80U | (code & 0x3FU))};
}

TEST(DataFromHex, ReadsAnyPairOfCharactersAsTheCLibraryDoes) {
    for (unsigned first = 0; first <= 0xFF; ++first) {
        for (unsigned second = 0; second <= 0xFF; ++second) {
            if (first == ' ' || second == ' ') continue;  // removed before pairs are made
            const char pair[] = {static_cast<char>(first), static_cast<char>(second), 0};
            const auto expected = static_cast<std::uint8_t>(std::strtol(pair, nullptr, 16));

            const auto data = BindUtils::dataFromHex(character(first) + character(second));

            ASSERT_EQ(data, Bytes{expected}) << first << " and " << second;
        }
    }
}

TEST(DataFromHex, TakesBackEveryByteThatDataToHexPrints) {
    for (unsigned value = 0; value <= 0xFF; ++value) {
        const Bytes data{static_cast<std::uint8_t>(value)};
        EXPECT_EQ(BindUtils::dataFromHex(BindUtils::dataToHex(data)), data);
    }
}

TEST(DataFromHex, TakesBackAnyDataThatDataToHexPrints) {
    std::mt19937 random(20240229);  // fixed, so that a failure comes back
    for (std::size_t size = 0; size < 300; ++size) {
        Bytes data(size);
        for (auto& byte : data) byte = static_cast<std::uint8_t>(random());

        const auto text = BindUtils::dataToHex(data);

        ASSERT_TRUE(text);
        EXPECT_EQ(text->size(), 2 * size);
        EXPECT_EQ(BindUtils::dataFromHex(text), data);
    }
}

}  // namespace
}  // namespace vlm
