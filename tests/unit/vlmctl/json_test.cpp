#include "services/vlmctl/json.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

namespace vlm::control {
namespace {

struct Row {
    const char* why;
    Json value;
    const char* text;
};

TEST(JsonTest, WritesEachKindOfValue) {
    const Row rows[] = {
        {"null", Json(), "null"},
        {"true", true, "true"},
        {"false", false, "false"},
        {"zero", 0, "0"},
        {"below zero", -1, "-1"},
        {"the least", std::numeric_limits<std::int64_t>::min(), "-9223372036854775808"},
        {"text", "a", "\"a\""},
        {"empty text", "", "\"\""},
        {"an empty array", Json::Array{}, "[]"},
        {"an empty object", Json::Object{}, "{}"},
    };
    for (const auto& [why, value, text] : rows) EXPECT_EQ(value.text(), text) << why;
}

TEST(JsonTest, WritesAnElementALine) {
    const Json value = Json::Object{{"list", Json::Array{1, "b"}}, {"none", Json()}};

    EXPECT_EQ(value.text(),
              "{\n"
              "  \"list\": [\n"
              "    1,\n"
              "    \"b\"\n"
              "  ],\n"
              "  \"none\": null\n"
              "}");
}

struct TextRow {
    const char* why;
    std::string text;
    const char* written;
};

TEST(JsonTest, WritesEveryTextAsValidJsonThatIsSafeOnATerminal) {
    const TextRow rows[] = {
        {"a quote", "a\"b", R"("a\"b")"},
        {"a backslash", "a\\b", R"("a\\b")"},
        {"a slash stays", "a/b", R"("a/b")"},
        {"a line feed", "a\nb", R"("a\nb")"},
        {"a tab", "a\tb", R"("a\tb")"},
        {"a zero", std::string("a\0b", 3), R"("a\u0000b")"},
        {"an escape", "\x1b[2J", R"("\u001b[2J")"},
        {"delete", "\x7f", R"("\u007f")"},
        {"a control character of the second set", "\xC2\x9B", R"("\u009b")"},
        {"an override of direction", "\xE2\x80\xAE", R"("\u202e")"},
        {"a line separator", "\xE2\x80\xA8", R"("\u2028")"},
        {"letters of other scripts stay", "Bj\xC3\xB6rn \xE6\x9D\x8E",
         "\"Bj\xC3\xB6rn \xE6\x9D\x8E\""},
        {"beyond the first plane too", "\xF0\x9F\x94\x91", "\"\xF0\x9F\x94\x91\""},
        {"a stray byte",
         "a\xFF"
         "b",
         "\"a\xEF\xBF\xBD"
         "b\""},
        {"a character that is cut", "a\xE2\x82", "\"a\xEF\xBF\xBD\""},
        {"an overlong form", "\xC0\xAF", "\"\xEF\xBF\xBD\xEF\xBF\xBD\""},
        {"a surrogate", "\xED\xA0\x80", "\"\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD\""},
    };
    for (const auto& [why, text, written] : rows) EXPECT_EQ(Json(text).text(), written) << why;
}

TEST(JsonTest, EscapesTheNamesOfMembersToo) {
    EXPECT_EQ(Json(Json::Object{{"a\n", 1}}).text(), "{\n  \"a\\n\": 1\n}");
}

}  // namespace
}  // namespace vlm::control
