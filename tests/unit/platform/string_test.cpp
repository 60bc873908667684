#include "platform/string.h"

#include <gtest/gtest.h>

#include <vector>

namespace vlm::platform {
namespace {

// What copyUtf8() leaves in a buffer of so many bytes, up to the terminator; none when it fails.
std::optional<std::string> copied(const String& text, std::size_t size) {
    std::vector<char> buffer(size, '#');
    if (!text.copyUtf8(buffer)) return std::nullopt;
    return std::string(buffer.data());
}

std::optional<std::string> copiedIntoMaximumSize(const String& text) {
    return copied(text, String::maximumUtf8Size(text.length()));
}

TEST(StringTest, GivesTextStoredAsUtf8Directly) {
    const String text("gr\xC3\xBC\xC3\x9F");

    EXPECT_EQ(text.directUtf8(), "gr\xC3\xBC\xC3\x9F");
}

TEST(StringTest, GivesEmptyTextStoredAsUtf8Directly) { EXPECT_EQ(String("").directUtf8(), ""); }

TEST(StringTest, GivesTextStoredAsUtf16OnlyByConversion) {
    EXPECT_FALSE(String::fromUtf16(u"abc").directUtf8());
}

TEST(StringTest, CountsItsLengthInUtf16Units) {
    EXPECT_EQ(String("").length(), 0u);
    EXPECT_EQ(String("abc").length(), 3u);
    EXPECT_EQ(String("\xE6\xB0\xB4").length(), 1u);
    EXPECT_EQ(String("\xF0\x9F\x92\xB3").length(), 2u);
    EXPECT_EQ(String::fromUtf16(u"\xD83D\xDCB3").length(), 2u);
    EXPECT_EQ(String("a\xFFz").length(), 3u);
}

TEST(StringTest, ConvertsUtf16OfEveryWidth) {
    EXPECT_EQ(copied(String::fromUtf16(u"a\u00E9\u6C34\U0001F4B3"), 64),
              "a\xC3\xA9\xE6\xB0\xB4\xF0\x9F\x92\xB3");
}

TEST(StringTest, ConvertsTheFirstAndTheLastCharacterOfEveryWidth) {
    EXPECT_EQ(copied(String::fromUtf16(u"\u0001\u007F"), 64), "\x01\x7F");
    EXPECT_EQ(copied(String::fromUtf16(u"\u0080\u07FF"), 64), "\xC2\x80\xDF\xBF");
    EXPECT_EQ(copied(String::fromUtf16(u"\u0800\uFFFF"), 64), "\xE0\xA0\x80\xEF\xBF\xBF");
    EXPECT_EQ(copied(String::fromUtf16(u"\U00010000\U0010FFFF"), 64),
              "\xF0\x90\x80\x80\xF4\x8F\xBF\xBF");
}

TEST(StringTest, ConvertsTextIntoItsMaximumSizeWhenAnyUnitTakesFewerThanThreeBytes) {
    EXPECT_EQ(copiedIntoMaximumSize(String::fromUtf16(u"\u6C34z")), "\xE6\xB0\xB4z");
    EXPECT_EQ(copiedIntoMaximumSize(String::fromUtf16(u"\U0001F4B3")), "\xF0\x9F\x92\xB3");
}

TEST(StringTest, FailsToConvertIntoItsMaximumSizeWhenEveryCharacterTakesThreeBytes) {
    EXPECT_EQ(copiedIntoMaximumSize(String::fromUtf16(u"\u6C34\u706B")), std::nullopt);
    EXPECT_EQ(copied(String::fromUtf16(u"\u6C34\u706B"), 7), "\xE6\xB0\xB4\xE7\x81\xAB");
}

TEST(StringTest, FailsToConvertEmptyUtf16IntoItsMaximumSize) {
    EXPECT_EQ(copiedIntoMaximumSize(String::fromUtf16(u"")), std::nullopt);
    EXPECT_EQ(copied(String::fromUtf16(u""), 1), "");
}

TEST(StringTest, FailsToConvertIntoABufferThatCutsACharacter) {
    EXPECT_EQ(copied(String::fromUtf16(u"a\u6C34"), 3), std::nullopt);
}

TEST(StringTest, CopiesTextStoredAsUtf8WithRoomForTheTerminatorOnly) {
    EXPECT_EQ(copied(String("abc"), 4), "abc");
    EXPECT_EQ(copied(String("abc"), 3), std::nullopt);
}

TEST(StringTest, FailsToConvertUnpairedSurrogates) {
    struct {
        const char* why;
        std::u16string text;
    } const rows[] = {
        {"a high one at the end", u"a\xD83D"},    {"a high one before a letter", u"\xD83D z"},
        {"a low one alone", u"\xDCB3 z"},         {"a pair the wrong way round", u"\xDCB3\xD83D"},
        {"two high ones", u"\xD83D\xD83D\xDCB3"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(copied(String::fromUtf16(row.text), 64), std::nullopt) << row.why;
}

struct IllFormed {
    const char* why;
    std::string text;
    std::string readable;
};

// U+FFFD, closed so that a letter behind it is not read as a digit of the escape.
#define GAP "\xEF\xBF\xBD"

const IllFormed kIllFormed[] = {
    {"a byte that continues nothing", "a\x80z", "a" GAP "z"},
    {"a lead byte at the end", "a\xC3", "a" GAP},
    {"a lead byte before a letter", "\xC3z", GAP "z"},
    {"a character cut after two of three bytes", "\xE6\xB0z", GAP "z"},
    {"a character cut after three of four bytes", "\xF0\x9F\x92", GAP},
    {"an overlong solidus of two bytes", "\xC0\xAF", GAP GAP},
    {"an overlong solidus of three bytes", "\xE0\x80\xAF", GAP GAP GAP},
    {"an overlong character of four bytes", "\xF0\x8F\xBF\xBF", GAP GAP GAP GAP},
    {"a surrogate", "\xED\xA0\xBD", GAP GAP GAP},
    {"above the last character", "\xF4\x90\x80\x80", GAP GAP GAP GAP},
    {"a lead byte that is never used", "\xF5z", GAP "z"},
    {"bytes that are never used", "\xFE\xFF", GAP GAP},
};

TEST(StringTest, FailsToConvertIllFormedUtf8) {
    for (const auto& row : kIllFormed)
        EXPECT_EQ(copied(String(row.text), 64), std::nullopt) << row.why;
}

TEST(StringTest, ShowsEachIllFormedPieceAsOneReplacementCharacter) {
    for (const auto& row : kIllFormed) EXPECT_EQ(String(row.text).utf8(), row.readable) << row.why;

    EXPECT_EQ(String::fromUtf16(u"a\xD83D z").utf8(), "a" GAP " z");
}

TEST(StringTest, IsEqualHoweverItIsStored) {
    EXPECT_EQ(String("\xE6\xB0\xB4"), String::fromUtf16(u"\u6C34"));
    EXPECT_NE(String("a"), String::fromUtf16(u"b"));
}

}  // namespace
}  // namespace vlm::platform
