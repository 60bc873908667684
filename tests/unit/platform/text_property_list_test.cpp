// The old text format.

#include <gtest/gtest.h>

#include "binary_list.h"
#include "examined.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

using test::examine;

TEST(TextPropertyListTest, ReadsWhatPeopleWrite) {
    struct {
        const char* why;
        const char* text;
        PropertyList value;
    } const rows[] = {
        {"an empty dictionary", "{}", Dictionary{}},
        {"an empty array", "()", Array{}},
        {"blanks of all kinds", " \t\r\n{ \n}\n", Dictionary{}},
        {"an entry", "{ key = value; }", Dictionary{{"key", "value"}}},
        {"entries without blanks", "{a=b;c=d;}", Dictionary{{"a", "b"}, {"c", "d"}}},
        {"entries keep their order", "{ z = 1; a = 2; }", Dictionary{{"z", "1"}, {"a", "2"}}},
        {"a number is text", "(1, -2.5, YES)", Array{"1", "-2.5", "YES"}},
        {"every character of a word", "(aZ09_$+/:.-)", Array{"aZ09_$+/:.-"}},
        {"a word with slashes is no comment", "(a//b, http://host/)",
         Array{"a//b", "http://host/"}},
        {"a comma at the end of an array", "( a, b, )", Array{"a", "b"}},
        {"quoted text", "( \"a b\", 'c \"d\"', \"it's\" )", Array{"a b", "c \"d\"", "it's"}},
        {"quoted keys", "{ \"a b\" = c; 'd e' = f; }", Dictionary{{"a b", "c"}, {"d e", "f"}}},
        {"empty text", "( \"\", '' )", Array{"", ""}},
        {"text of several lines", "( \"a\nb\" )", Array{"a\nb"}},
        {"text that is not ASCII", "( \"caf\xC3\xA9 \xF0\x9F\x92\xB3\" )",
         Array{"caf\xC3\xA9 \xF0\x9F\x92\xB3"}},
        {"escapes of a letter", R"("\a\b\f\n\r\t\v\\\"\'")", "\a\b\f\n\r\t\v\\\"'"},
        {"an escaped line break", "\"a\\\nb\"", "a\nb"},
        {"octal numbers end after three digits", R"("\1\12\1011\60")",
         "\x01\x0A"
         "A1"
         "0"},
        {"an octal number beyond ASCII is a character of Unicode", R"("\351")", "\xC3\xA9"},
        {"the greatest octal number", R"("\377")", "\xC3\xBF"},
        {"UTF-16 in digits of either case", R"("\U00e9\U6C34x")", "\xC3\xA9\xE6\xB0\xB4x"},
        {"a pair of surrogates", R"("\Ud83d\Udcb3")", "\xF0\x9F\x92\xB3"},
        {"data", "( <>, <0fB7>, < 0 f b 7\n01 > )",
         Array{Bytes{}, Bytes{0x0F, 0xB7}, Bytes{0x0F, 0xB7, 0x01}}},
        {"data that is the whole list", "<deadBEEF>", Bytes{0xDE, 0xAD, 0xBE, 0xEF}},
        {"a quoted text that is the whole list", " 'a' // b", "a"},
        {"collections inside each other", "{ a = ( {}, ( b ) ); c = { d = <01>; }; }",
         Dictionary{{"a", Array{Dictionary{}, Array{"b"}}}, {"c", Dictionary{{"d", Bytes{1}}}}}},
        {"comments", "// a\n{ /* b = c; */ d /**/ = // e\n f; /* * / */ }\n/* g */ // h",
         Dictionary{{"d", "f"}}},
        {"a comment up to a carriage return", "// a\r{}", Dictionary{}},
        {"entries without braces", "\"a b\" = c;\n/* d */ e = ( f );\n",
         Dictionary{{"a b", "c"}, {"e", Array{"f"}}}},
        {"the last value of a key, in the place of the first", "{ a = 1; b = 2; a = 3; }",
         Dictionary{{"a", "3"}, {"b", "2"}}},
        {"a mark of UTF-8", "\xEF\xBB\xBF( a )", Array{"a"}},
    };
    for (const auto& row : rows) {
        test::expectValue(examine(row.text), PropertyListFormat::Text, row.value, row.why);
    }
}

TEST(TextPropertyListTest, ReadsAZeroCharacterThatIsEscaped) {
    EXPECT_EQ(examine(R"("a\0b")").value, PropertyList(std::string("a\0b", 3)));
}

TEST(TextPropertyListTest, ReadsUtf16BehindAMark) {
    const Bytes little = fromHex("FF FE 28 00 22 00 34 6C 3D D8 B3 DC 22 00 29 00");
    const Bytes big = fromHex("FE FF 00 28 00 22 6C 34 D8 3D DC B3 00 22 00 29");
    const PropertyList value = Array{"\xE6\xB0\xB4\xF0\x9F\x92\xB3"};

    EXPECT_EQ(readPropertyList(little), value);
    EXPECT_EQ(readPropertyList(big), value);
}

TEST(TextPropertyListTest, TellsWhatIsWrongAndWhere) {
    struct {
        const char* why;
        const char* text;
        const char* problem;
        std::size_t line;
        std::size_t column;
    } const rows[] = {
        {"nothing", "", "There is nothing in it.", 1, 1},
        {"nothing but a comment", "// a\n", "There is nothing in it.", 2, 1},
        {"a bare word", "\n hello", "This is neither a list nor a key that '=' follows.", 2, 2},
        {"words", "hello there", "This is neither a list nor a key that '=' follows.", 1, 1},
        {"a sign of no meaning", "{ a = %; }", "There is a value missing here.", 1, 7},
        {"a letter that has to be quoted", "( caf\xC3\xA9 )",
         "There is a ',' or a ')' missing here.", 1, 6},
        {"a column is a character", "( \"\xC3\xA9\xE6\xB0\xB4\" % )",
         "There is a ',' or a ')' missing here.", 1, 8},
        {"an array that does not end", "( a", "There is a ',' or a ')' missing here.", 1, 4},
        {"an array that ends behind a comma", "( a,", "There is a value missing here.", 1, 5},
        {"an array without commas", "( a b )", "There is a ',' or a ')' missing here.", 1, 5},
        {"a comma alone", "( , )", "There is a value missing here.", 1, 3},
        {"a dictionary that does not end", "{ a = b;\n", "There is a key missing here.", 2, 1},
        {"a key that is no text", "{ <01> = b; }", "There is a key missing here.", 1, 3},
        {"a key alone", "{ a; }", "There is a '=' missing here.", 1, 4},
        {"a key without a value", "{ a = ; }", "There is a value missing here.", 1, 7},
        {"no semicolon", "{ a = b }", "There is a ';' missing here.", 1, 9},
        {"no semicolon on the last line", "a = b;\r\nc = d", "There is a ';' missing here.", 2, 6},
        {"something behind the end", "{} {}", "There is something behind the end of the list.", 1,
         4},
        {"a brace that closes nothing", "a = b; }", "There is a key missing here.", 1, 8},
        {"text that does not end", "( a,\n \"b )", "This text does not end.", 2, 2},
        {"text that ends with a backslash", "( \"b\\", "This text does not end.", 1, 5},
        {"an unknown escape", "( \"\\q\" )", "There is no such character to a backslash.", 1, 4},
        {"an octal number too great", "( \"\\400\" )",
         "The greatest octal number of a character is 377.", 1, 5},
        {"too few digits", "( \"\\U12\" )", "\\U takes four hexadecimal digits.", 1, 5},
        {"digits that end with the data", "( \"\\U12", "\\U takes four hexadecimal digits.", 1, 5},
        {"a high surrogate alone", "( \"\\Ud83d\" )",
         "This is half of a UTF-16 surrogate pair, and no character.", 1, 5},
        {"a low surrogate alone", "( \"\\Udcb3\" )",
         "This is half of a UTF-16 surrogate pair, and no character.", 1, 5},
        {"a high surrogate before a letter", "( \"\\Ud83d\\U0041\" )",
         "This is half of a UTF-16 surrogate pair, and no character.", 1, 5},
        {"a high surrogate before another escape", "( \"\\Ud83d\\n\" )",
         "\\U takes four hexadecimal digits.", 1, 11},
        {"data that does not end", "( <01 )", "This is no hexadecimal digit.", 1, 7},
        {"data up to the end", "( <01", "This data does not end.", 1, 3},
        {"half a byte", "( <011> )", "This data ends with half a byte.", 1, 3},
        {"a comment that does not end", "{}\n/* a", "This comment does not end.", 2, 1},
        {"such a comment in an array", "( a, /* ", "This comment does not end.", 1, 6},
        {"such a comment in a dictionary", "{ /* ", "This comment does not end.", 1, 3},
        {"a line after carriage returns", "(\r\r%)", "There is a value missing here.", 3, 1},
        {"text that is not UTF-8", "( a,\n \"\xFF\" )", "This is not UTF-8.", 2, 3},
        {"a surrogate in UTF-8", "( \"\xED\xA0\xBD\" )", "This is not UTF-8.", 1, 4},
        {"a control character", "( \"\x1B\" )",
         "The character with the code 27 is no part of a text.", 1, 4},
    };
    for (const auto& row : rows) {
        test::expectProblem(examine(row.text), PropertyListFormat::Text, row);
    }
}

TEST(TextPropertyListTest, RefusesUtf16ThatIsBroken) {
    struct {
        const char* why;
        std::string_view bytes;
        const char* problem;
        std::size_t column;
    } const rows[] = {
        {"a surrogate alone", "FF FE 28 00 22 00 3D D8 22 00 29 00",
         "This is half of a UTF-16 surrogate pair, and no character.", 3},
        {"a byte too few", "FF FE 28 00 29", "The last UTF-16 character is cut.", 2},
        {"a zero", "FE FF 00 28 00 00", "The character with the code 0 is no part of a text.", 2},
    };
    for (const auto& row : rows) {
        const auto found = examinePropertyList(fromHex(row.bytes));
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_EQ(found.problem, row.problem) << row.why;
        EXPECT_EQ(found.column, row.column) << row.why;
    }
}

TEST(TextPropertyListTest, KeepsToTheLimits) {
    struct {
        const char* why;
        const char* text;
        PropertyListLimits enough;
        PropertyListLimits tooFew;
        const char* problem;
        std::size_t column;
    } const rows[] = {
        {"depth of arrays",
         "((()))",
         {.depth = 3},
         {.depth = 2},
         "Arrays and dictionaries lie too deep inside each other.",
         3},
        {"depth of dictionaries",
         "{a={};}",
         {.depth = 2},
         {.depth = 1},
         "Arrays and dictionaries lie too deep inside each other.",
         4},
        {"depth without braces",
         "a=();",
         {.depth = 2},
         {.depth = 1},
         "Arrays and dictionaries lie too deep inside each other.",
         3},
        {"an outermost dictionary without braces",
         "a=b;",
         {.depth = 1},
         {.depth = 0},
         "Arrays and dictionaries lie too deep inside each other.",
         2},
        {"values",
         "(a,b)",
         {.objects = 3},
         {.objects = 2},
         "There are more values than are read.",
         4},
        {"keys",
         "{a=b;}",
         {.objects = 3},
         {.objects = 1},
         "There are more values than are read.",
         2},
        {"keys without braces",
         "a=b;",
         {.objects = 3},
         {.objects = 1},
         "There are more values than are read.",
         2},
        {"the only text",
         "'a'",
         {.objects = 1},
         {.objects = 0},
         "There are more values than are read.",
         1},
    };
    for (const auto& row : rows) {
        EXPECT_TRUE(examine(row.text, row.enough).value) << row.why;
        const auto found = examine(row.text, row.tooFew);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_EQ(found.problem, row.problem) << row.why;
        EXPECT_EQ(found.column, row.column) << row.why;
    }
}

// In UTF-16 a text takes fewer bytes than in the UTF-8 that values hold.
TEST(TextPropertyListTest, CountsTheBytesThatValuesHold) {
    const Bytes text = fromHex(
        "FE FF 00 28 00 22 6C 34 6C 34 6C 34 6C 34 6C 34 6C 34 6C 34 6C 34"
        "6C 34 6C 34 6C 34 6C 34 6C 34 6C 34 00 22 00 29");
    ASSERT_EQ(text.size(), 38u);

    EXPECT_TRUE(readPropertyList(text, {.bytes = 42}));
    const auto found = examinePropertyList(text, {.bytes = 41});
    EXPECT_EQ(found.problem, "There is more text and data than is read.");
    EXPECT_EQ(found.column, 2u);
}

}  // namespace
}  // namespace vlm::platform
