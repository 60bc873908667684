#include "platform/harmless_text.h"

#include <gtest/gtest.h>

namespace vlm::platform {
namespace {

#define REPLACED "\xEF\xBF\xBD"

struct Row {
    std::string text;
    std::string harmless;
    const char* why;
};

TEST(HarmlessTextTest, ReplacesWhatWouldActInsteadOfShow) {
    const Row rows[] = {
        {"", "", "nothing"},
        {"Alice - PIV (9A)~", "Alice - PIV (9A)~", "plain text, up to its last character"},
        {"Zo\xC3\xAB \xE6\x9D\x8E \xF0\x9F\x98\x80", "Zo\xC3\xAB \xE6\x9D\x8E \xF0\x9F\x98\x80",
         "any script"},
        {"\xD7\xA9\xD7\x9C\xD7\x95\xD7\x9D", "\xD7\xA9\xD7\x9C\xD7\x95\xD7\x9D",
         "letters that are written from right to left"},
        {"a\nb", "a" REPLACED "b", "a line feed forges a line"},
        {"a\tb\rc", "a" REPLACED "b" REPLACED "c", "a tab forges a column"},
        {"\x1B[2J", REPLACED "[2J", "an escape sequence"},
        {"a\x7F", "a" REPLACED, "delete"},
        {std::string("a\0b", 3), "a" REPLACED "b", "a zero"},
        {"\xC2\x9B"
         "2J",
         REPLACED "2J", "the one-character form of an escape sequence"},
        {"\xC2\xA0", "\xC2\xA0", "just above the control characters"},
        {"\xD8\x9C", REPLACED, "Arabic letter mark"},
        {"\xE2\x80\x8F", REPLACED, "right-to-left mark"},
        {"\xE2\x80\xA8\xE2\x80\xA9", REPLACED REPLACED, "line and paragraph breaks"},
        {"abc\xE2\x80\xAE"
         "cba",
         "abc" REPLACED "cba", "an override of direction"},
        {"\xE2\x81\xA6x\xE2\x81\xA9", REPLACED "x" REPLACED, "isolates"},
        {"a\xFF"
         "b",
         "a" REPLACED "b", "a byte that is no text"},
        {"a\xE2\x82", "a" REPLACED, "a character cut off at the end"},
        {"\xC0\x8A", REPLACED REPLACED, "a line feed in an overlong form"},
        {"\xe0\x80\x8a", REPLACED REPLACED REPLACED, "one in an even longer form"},
        {"\xed\xa0\x80", REPLACED REPLACED REPLACED, "a surrogate"},
        {"\xf4\x90\x80\x80", REPLACED REPLACED REPLACED REPLACED, "beyond the last character"},
        {"\u200d\u2010\u2027\u202f\u2065\u206a", "\u200d\u2010\u2027\u202f\u2065\u206a",
         "the neighbours of those that act"},
    };
    for (const auto& row : rows) EXPECT_EQ(harmlessText(row.text), row.harmless) << row.why;
}

TEST(HarmlessTextTest, CutsBetweenCharactersAndSaysSo) {
    EXPECT_EQ(harmlessText("\u00e4\u00e4\u00e4", 2), "\u00e4\u00e4...");
    EXPECT_EQ(harmlessText("abc", 3), "abc");
    EXPECT_EQ(harmlessText("a", 0), "...");
}

}  // namespace
}  // namespace vlm::platform
