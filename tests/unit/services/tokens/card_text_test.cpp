#include "services/hints/tokens/card_text.h"

#include <gtest/gtest.h>

namespace vlm::service {
namespace {

struct Case {
    const char* why;
    std::string text;
    std::string harmless;
};

TEST(CardTextTest, IsMadeHarmless) {
    const std::vector<Case> cases = {
        {"plain text stays", "Alice Example", "Alice Example"},
        {"text of all lengths of character stays", "a\u00e9\u20ac\U0001F511",
         "a\u00e9\u20ac\U0001F511"},
        {"right-to-left text stays", "\u05e9\u05dc", "\u05e9\u05dc"},
        {"blanks and zeros around it go", std::string("  \0x y \0 ", 9), "x y"},
        {"nothing is nothing", "", ""},
        {"only blanks are nothing", "   ", ""},
        {"line feed, tab, escape", "a\nb\tc\x1b", "a\ufffdb\ufffdc\ufffd"},
        {"a zero within", std::string("a\0b", 3), "a\ufffdb"},
        {"delete", "a\x7f", "a\ufffd"},
        {"second set of controls", "a\u0080\u009f\u00a0", "a\ufffd\ufffd\u00a0"},
        {"line and paragraph ends", "a\u2028\u2029", "a\ufffd\ufffd"},
        {"direction marks", "\u200e\u200f\u061c", "\ufffd\ufffd\ufffd"},
        {"embeddings and overrides", "\u202a\u202e", "\ufffd\ufffd"},
        {"isolates", "\u2066\u2069", "\ufffd\ufffd"},
        {"neighbours of these stay", "\u200d\u2010\u2027\u202f\u2065\u206a",
         "\u200d\u2010\u2027\u202f\u2065\u206a"},
        {"a lone continuation", "\x80", "\ufffd"},
        {"a cut character", "\xe2\x82", "\ufffd"},
        {"a cut character before text", "\xe2\x82z", "\ufffdz"},
        {"a character that is too long", "\xc0\xaf", "\ufffd\ufffd"},
        {"bytes that never occur", "\xff\xfe", "\ufffd\ufffd"},
    };
    for (const Case& each : cases) EXPECT_EQ(cardText(each.text), each.harmless) << each.why;
}

TEST(CardTextTest, IsCutAtWholeCharacters) {
    std::string text;
    for (int i = 0; i < 300; ++i) text += "\u20ac";

    EXPECT_EQ(cardText(text), text.substr(0, 3 * kCardTextLength) + "...");
    EXPECT_EQ(cardText(text, 2), "\u20ac\u20ac...");
}

}  // namespace
}  // namespace vlm::service
