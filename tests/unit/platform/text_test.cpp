#include "platform/text.h"

#include <gtest/gtest.h>

namespace vlm::platform {
namespace {

TEST(TextTest, PutsEachValueInThePlaceOfItsBraces) {
    EXPECT_EQ(text("{} of {}", 1, "two"), "1 of two");
    EXPECT_EQ(text("{}{}", "a", "b"), "ab");
}

TEST(TextTest, LeavesAPatternWithoutBracesAlone) { EXPECT_EQ(text("100% {sure}"), "100% {sure}"); }

TEST(TextTest, KeepsBracesThatHaveNoValue) { EXPECT_EQ(text("{} and {}", 1), "1 and {}"); }

TEST(TextTest, DropsSpareValues) { EXPECT_EQ(text("{}.", 1, 2), "1."); }

TEST(TextTest, DoesNotFillInBracesThatCameWithAValue) {
    EXPECT_EQ(text("{} {}", "{}", "x"), "{} x");
}

TEST(TextTest, PrintsNumbersInDecimal) {
    EXPECT_EQ(text("{}", std::int32_t{-8}), "-8");
    EXPECT_EQ(text("{}", kNobody), "4294967295");
    EXPECT_EQ(text("{}", std::uint64_t{18446744073709551615U}), "18446744073709551615");
}

TEST(TextTest, PrintsBooleansAsNumbers) { EXPECT_EQ(text("{} {}", true, false), "1 0"); }

TEST(TextTest, PrintsTextHoweverItIsStored) {
    EXPECT_EQ(
        text("{} {} {}", std::string("a"), std::string_view("b"), String::fromUtf16(u"\u00E9")),
        "a b \xC3\xA9");
}

TEST(TextTest, PrintsBytesInUpperCaseHexadecimal) {
    EXPECT_EQ(text("{} {}", Bytes{0x00, 0x1F, 0xA0, 0xFF}, Bytes{}), "<001FA0FF> <>");
}

TEST(TextTest, PrintsErrorsWithDomainCodeAndDescription) {
    EXPECT_EQ(text("{}", Error{"VLErrorDomain", -8, "no such card"}),
              "VLErrorDomain error -8: no such card");
    EXPECT_EQ(text("{}", Error{"VLErrorDomain", -8, std::nullopt}), "VLErrorDomain error -8");
}

TEST(TextTest, PrintsAnAbsentValueAsNull) {
    EXPECT_EQ(text("{}", std::optional<std::string>()), "(null)");
    EXPECT_EQ(text("{}", std::optional<Error>()), "(null)");
    EXPECT_EQ(text("{}", std::optional<std::int32_t>(7)), "7");
}

TEST(TextTest, PrintsPropertyListsAsTheyDescribeThemselves) {
    EXPECT_EQ(text("{}", PropertyList(PropertyList::Array{1, "two"})), "[1, \"two\"]");
    EXPECT_EQ(text("{}", 2.5), "2.5");
}

}  // namespace
}  // namespace vlm::platform
