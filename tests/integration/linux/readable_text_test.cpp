#include "platform/linux/readable_text.h"

#include <gtest/gtest.h>

namespace vlm::test {

TEST(ReadableTextTest, MakesForeignTextAPartOfOneLine) {
    struct Row {
        const char* why;
        std::string text;
        std::string expected;
    };
    const Row rows[] = {
        {"plain text stays", "a b: \"c\" \\d", "a b: \"c\" \\d"},
        {"nothing stays nothing", "", ""},
        {"other letters stay", "gr\xC3\xBC\xC3\x9F \xE6\xBC\xA2",
         "gr\xC3\xBC\xC3\x9F \xE6\xBC\xA2"},
        {"no line of its own", "a\nb\r", "a\\nb\\x0d"},
        {"a tab", "a\tb", "a\\tb"},
        {"no steering of terminals", "\x1b[31m\x7F", "\\x1b[31m\\x7f"},
        {"nor with one character",
         "\xC2\x9B"
         "31m",
         "\\x9b31m"},
        {"a zero", std::string("a\0b", 3), "a\\x00b"},
        {"line separators",
         "a\xE2\x80\xA8"
         "b\xE2\x80\xA9",
         "a\\u2028b\\u2029"},
        {"broken UTF-8",
         "a\xFF"
         "b",
         "a\xEF\xBF\xBD"
         "b"},
        {"cut UTF-8", "a\xE6\xBC", "a\xEF\xBF\xBD"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(platform::readable(row.text, 100), row.expected) << row.why;
}

TEST(ReadableTextTest, CutsBetweenCharacters) {
    EXPECT_EQ(platform::readable("abcd", 4), "abcd");
    EXPECT_EQ(platform::readable("abcde", 4), "abcd...");
    EXPECT_EQ(platform::readable("abc\xC3\xBC", 4), "abc...");
    EXPECT_EQ(platform::readable("abc\n", 4), "abc...");
    EXPECT_EQ(platform::readable("a", 0), "...");
}

}  // namespace vlm::test
