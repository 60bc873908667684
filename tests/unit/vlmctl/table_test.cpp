#include "services/vlmctl/table.h"

#include <gtest/gtest.h>

#include <sstream>

#include "services/vlmctl/display_width.h"

namespace vlm::control {
namespace {

std::string printed(const Table& table, bool withLegend = true) {
    std::ostringstream lines;
    std::ostringstream complaints;
    Output output(lines, complaints);
    table.print(output, withLegend, "Nothing.");
    return lines.str();
}

TEST(TableTest, MakesEachColumnAsWideAsItsWidestCell) {
    Table table({"KEY", "VALUE", "ORIGIN"});
    table.add({"a", "1", "machine"});
    table.add({"longer", "12345678", "default"});

    EXPECT_EQ(printed(table),
              "KEY     VALUE     ORIGIN\n"
              "a       1         machine\n"
              "longer  12345678  default\n");
}

TEST(TableTest, WithoutALegendIsAsWideAsItsRowsOnly) {
    Table table({"LONG HEADING", "B"});
    table.add({"a", "b"});

    EXPECT_EQ(printed(table, /*withLegend=*/false), "a  b\n");
}

TEST(TableTest, WithoutRowsSaysSoUnlessAProgramReadsIt) {
    const Table table({"A"});

    EXPECT_EQ(printed(table), "Nothing.\n");
    EXPECT_EQ(printed(table, /*withLegend=*/false), "");
}

TEST(TableTest, ShowsADashForACellWithoutText) {
    Table table({"A", "B", "C"});
    table.add({"", "b"});

    EXPECT_EQ(printed(table), "A  B  C\n-  b  -\n");
}

TEST(TableTest, CountsColumnsAndNotBytes) {
    Table table({"NAME", "B"});
    table.add({"Bj\xC3\xB6rn", "1"});              // one letter of two bytes
    table.add({"\xE6\x9D\x8E\xE5\xB0\x8F", "2"});  // two letters of two columns
    table.add({"e\xCC\x81", "3"});                 // a letter and its accent

    EXPECT_EQ(printed(table),
              "NAME   B\n"
              "Bj\xC3\xB6rn  1\n"
              "\xE6\x9D\x8E\xE5\xB0\x8F   2\n"
              "e\xCC\x81      3\n");
}

TEST(TableTest, LetsNoCellForgeARowOrActOnATerminal) {
    Table table({"A", "B"});
    table.add({"x\ny", "\x1b[2J"});

    EXPECT_EQ(printed(table),
              "A    B\n"
              "x\xEF\xBF\xBDy  \xEF\xBF\xBD[2J\n");
}

struct Width {
    const char* why;
    std::string text;
    std::size_t columns;
};

TEST(DisplayWidth, IsWhatATerminalTakes) {
    const Width rows[] = {
        {"nothing", "", 0},
        {"letters", "abc", 3},
        {"an accented letter", "\xC3\xB6", 1},
        {"a letter and its accent", "o\xCC\x88", 1},
        {"Han", "\xE6\x9D\x8E", 2},
        {"Hangul", "\xED\x95\x9C", 2},
        {"kana", "\xE3\x81\x82", 2},
        {"full-width Latin", "\xEF\xBC\xA1", 2},
        {"half-width kana", "\xEF\xBD\xB1", 1},
        {"an emoji", "\xF0\x9F\x94\x91", 2},
        {"a joiner", "\xE2\x80\x8D", 0},
        {"a stray byte shows as one sign", "\xFF", 1},
    };
    for (const auto& [why, text, columns] : rows) EXPECT_EQ(displayWidth(text), columns) << why;
}

}  // namespace
}  // namespace vlm::control
