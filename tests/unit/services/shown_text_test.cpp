#include "services/hints/shown_text.h"

#include <gtest/gtest.h>

namespace vlm::service {
namespace {

struct Row {
    const char* why;
    std::string_view text;
    const char* shown;
};

TEST(ShownTextTest, KeepsTextAndReplacesWhatActs) {
    const Row rows[] = {
        {"text stays", "Alice", "Alice"},
        {"also beyond ASCII", "J\u00fcrgen \u6f22", "J\u00fcrgen \u6f22"},
        {"nothing stays nothing", "", ""},
        {"an escape sequence", "a\x1b[31mb", "a\uFFFD[31mb"},
        {"a line end", "a\nb\r", "a\uFFFDb\uFFFD"},
        {"a C1 control character",
         "a\u009b"
         "b",
         "a\uFFFD"
         "b"},
        {"a change of direction",
         "a\u202eb\u2066"
         "c",
         "a\uFFFD"
         "b\uFFFD"
         "c"},
        {"a broken byte",
         "a\xff"
         "b",
         "a\uFFFD"
         "b"},
        {"a zero byte", std::string_view("a\0b", 3),
         "a\uFFFD"
         "b"},
    };
    for (const auto& [why, text, shown] : rows) EXPECT_EQ(shownText(text), shown) << why;
}

TEST(ShownTextTest, CutsBetweenCharacters) {
    EXPECT_EQ(shownText("\u00e4\u00e4\u00e4", 2), "\u00e4\u00e4...");
    EXPECT_EQ(shownText("abc", 3), "abc");
}

TEST(ShownTextTest, ShowsAHashInUpperCaseHexadecimal) {
    EXPECT_EQ(shownHash({0x0A, 0xFF, 0x00}), "0AFF00");
}

}  // namespace
}  // namespace vlm::service
