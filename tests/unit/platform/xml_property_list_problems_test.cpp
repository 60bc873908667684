// What is no list in XML, and what is said about it.

#include <gtest/gtest.h>

#include "examined.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using test::examine;
using test::examineXmlValue;

TEST(XmlPropertyListProblemsTest, ExpandsNoEntityOfADocument) {
    struct {
        const char* why;
        const char* text;
        std::size_t column;
    } const rows[] = {
        {"an entity of its own",
         "<!DOCTYPE plist [<!ENTITY a \"b\">]><plist><string>x&a;</string></plist>", 51},
        {"one in a file",
         "<!DOCTYPE plist [<!ENTITY a SYSTEM \"file:///etc/passwd\">]><plist><string>x&a;"
         "</string></plist>",
         75},
        {"one in a key", "<plist><dict><key>&a;</key><true/></dict></plist>", 19},
        {"one that was never declared", "<plist><string>&a;</string></plist>", 16},
        {"one in a number", "<plist><integer>&a;</integer></plist>", 17},
    };
    for (const auto& row : rows) {
        const auto found = examine(row.text);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_EQ(found.problem, "The entity \"a\" is not expanded; only those of XML itself are.")
            << row.why;
        EXPECT_EQ(found.line, 1u) << row.why;
        EXPECT_EQ(found.column, row.column) << row.why;
    }
}

TEST(XmlPropertyListProblemsTest, RefusesScalarsThatAreNone) {
    struct {
        const char* why;
        const char* element;
    } const rows[] = {
        {"no digits", "<integer></integer>"},
        {"letters", "<integer>a</integer>"},
        {"something behind the digits", "<integer>1 2</integer>"},
        {"a fraction", "<integer>1.0</integer>"},
        {"two signs", "<integer>--1</integer>"},
        {"a sign behind the prefix", "<integer>0x-1</integer>"},
        {"no digits behind the prefix", "<integer>0x</integer>"},
        {"above every range", "<integer>18446744073709551616</integer>"},
        {"below every range", "<integer>-9223372036854775809</integer>"},
        {"a boolean is no number", "<integer>true</integer>"},
        {"no real", "<real/>"},
        {"a real with a comma", "<real>1,5</real>"},
        {"a real with two signs", "<real>+-1</real>"},
        {"a hexadecimal real", "<real>0x1p3</real>"},
        {"a real that is too great", "<real>1e999</real>"},
        {"a NaN with a payload", "<real>nan(1)</real>"},
        {"a real with something behind", "<real>1e</real>"},
        {"text in a boolean", "<true>true</true>"},
        {"no date", "<date/>"},
        {"a date without a time", "<date>2001-01-01</date>"},
        {"a date in another zone", "<date>2001-01-01T00:00:00+01:00</date>"},
        {"a date without a zone", "<date>2001-01-01T00:00:00</date>"},
        {"a date with a fraction", "<date>2001-01-01T00:00:00.5Z</date>"},
        {"a day that is not there", "<date>2001-02-29T00:00:00Z</date>"},
        {"a month that is not there", "<date>2001-13-01T00:00:00Z</date>"},
        {"a day zero", "<date>2001-01-00T00:00:00Z</date>"},
        {"an hour that is not there", "<date>2001-01-01T24:00:00Z</date>"},
        {"a minute that is not there", "<date>2001-01-01T00:60:00Z</date>"},
        {"a leap second", "<date>2016-12-31T23:59:60Z</date>"},
        {"a year zero", "<date>0000-01-01T00:00:00Z</date>"},
        {"another sign in a number", "<date>2001-01-01T00:00:+1Z</date>"},
        {"data that is cut", "<data>AQI</data>"},
        {"data of one character", "<data>A</data>"},
        {"padding alone", "<data>====</data>"},
        {"three characters of padding", "<data>A===</data>"},
        {"padding in the middle", "<data>AQ==AQID</data>"},
        {"padding before a character", "<data>AQ=D</data>"},
        {"bits in the padding", "<data>AR==</data>"},
        {"bits in the shorter padding", "<data>AQJ=</data>"},
        {"a character that is not Base64", "<data>AQ-D</data>"},
        {"a character that is not ASCII", "<data>AQI\xC3\xA9</data>"},
    };
    for (const auto& row : rows) {
        const auto found = examineXmlValue(row.element);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_TRUE(found.problem.starts_with("This is no ") ||
                    found.problem.ends_with("holds no text."))
            << row.why << ": " << found.problem;
        EXPECT_EQ(found.column, 8u) << row.why;
    }
}

TEST(XmlPropertyListProblemsTest, TellsWhatIsWrongAndWhere) {
    struct {
        const char* why;
        const char* text;
        const char* problem;
        std::size_t line;
        std::size_t column;
    } const rows[] = {
        {"no element", "<?xml version=\"1.0\"?>\n", "There is no element in it.", 2, 1},
        {"another outermost element", "<!---->\n<dict/>",
         "The outermost element is \"dict\", not \"plist\".", 2, 1},
        {"elements without a list around", "<dict><key>a</key><true/></dict>",
         "The outermost element is \"dict\", not \"plist\".", 1, 1},
        {"another version", "<plist version=\"2.0\"><true/></plist>",
         "The element \"plist\" takes version=\"1.0\" only.", 1, 1},
        {"another attribute", "<plist version=\"1.0\" a=\"b\"><true/></plist>",
         "The element \"plist\" takes version=\"1.0\" only.", 1, 1},
        {"no value", "\n <plist></plist>", "The element \"plist\" holds no value.", 2, 2},
        {"two values", "<plist><true/>\n<true/></plist>",
         "The element \"plist\" holds more than one value.", 2, 1},
        {"two lists", "<plist><true/></plist>\n<plist/>", "There is a second outermost element.", 2,
         1},
        {"text behind the list", "<plist><true/></plist>a",
         "There is text outside of all elements.", 1, 23},
        {"text in the list", "<plist>a<true/></plist>",
         "Text has no place in the element \"plist\".", 1, 8},
        {"text in an array", "<plist><array><true/> a</array></plist>",
         "Text has no place in the element \"array\".", 1, 22},
        {"text in a dictionary", "<plist><dict>&amp;</dict></plist>",
         "Text has no place in the element \"dict\".", 1, 14},
        {"an unknown element", "<plist>\n\t<array>\n\t\t<set/></array></plist>",
         "No value is written as the element \"set\".", 3, 3},
        {"letters count", "<plist><Dict/></plist>", "No value is written as the element \"Dict\".",
         1, 8},
        {"an unknown element with a name for terminals", "<plist><\xE2\x80\xAE/></plist>",
         "No value is written as the element \"\uFFFD\".", 1, 8},
        {"an unknown element with a long name",
         "<plist><aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa/></plist>",
         "No value is written as the element \"aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa...\".", 1,
         8},
        {"an attribute", "<plist><string a=\"b\">c</string></plist>",
         "The element \"string\" takes no attribute.", 1, 8},
        {"an attribute of a key", "<plist><dict><key a=\"b\"/><true/></dict></plist>",
         "The element \"key\" takes no attribute.", 1, 14},
        {"an element in text", "<plist><string>a<b/></string></plist>",
         "The element \"string\" holds no other elements.", 1, 17},
        {"an element in a number", "<plist><integer><integer>1</integer></integer></plist>",
         "The element \"integer\" holds no other elements.", 1, 17},
        {"a key outside of dictionaries", "<plist><array><key>a</key></array></plist>",
         "A key has its place in a dictionary only.", 1, 15},
        {"a key that is the list", "<plist><key>a</key></plist>",
         "A key has its place in a dictionary only.", 1, 8},
        {"a value without a key", "<plist><dict><true/></dict></plist>",
         "There is a key missing before this element.", 1, 14},
        {"two values of a key", "<plist><dict><key>a</key><true/><false/></dict></plist>",
         "There is a key missing before this element.", 1, 33},
        {"a key without a value", "<plist><dict><key>a</key></dict></plist>",
         "This key has no value.", 1, 14},
        {"two keys", "<plist><dict><key>a</key><key>b</key></dict></plist>",
         "A key has its place in a dictionary only.", 1, 26},
        {"an ampersand alone", "<plist><string>a & b</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 18},
        {"an ampersand before a word that ends", "<plist><string>a & b; c</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 18},
        {"a reference to no character", "<plist><string>&#0;</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 16},
        {"a reference to half a character", "<plist><string>&#xD83D;</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 16},
        {"a reference beyond all characters", "<plist><string>&#x110000;</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 16},
        {"a reference that is no number", "<plist><string>&#x;</string></plist>",
         "This '&' begins no reference; as a character it is \"&amp;\".", 1, 16},
        {"an element that does not end", "<plist>\n<array>",
         "An element does not end where it should.", 2, 8},
        {"an end of another element", "<plist><array></dict></plist>",
         "An element does not end where it should.", 1, 17},
        {"an end too many", "<plist><true/></plist></plist>",
         "An element does not end where it should.", 1, 25},
        {"an attribute without quotes", "<plist version=1><true/></plist>",
         "This attribute is not well formed.", 1, 16},
        {"a tag that is cut", "<plist", "This is not well-formed XML.", 1, 7},
        {"a comment that does not end", "<plist><!-- ", "This comment does not end.", 1, 8},
        {"a CDATA section that does not end", "<plist><string><![CDATA[a",
         "This CDATA section does not end.", 1, 16},
        {"a document type that does not end", "<!DOCTYPE plist [",
         "This document type does not end, or is out of place.", 1, 1},
        {"an instruction that does not end", "<plist><?a ",
         "This instruction does not end, or is out of place.", 1, 8},
        {"another encoding",
         "<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?><plist><true/></plist>",
         "The encoding is declared to be neither UTF-8 nor UTF-16.", 1, 1},
        {"text that is not UTF-8", "<plist>\n<string>a\xE9</string></plist>", "This is not UTF-8.",
         2, 10},
        {"a control character", "<plist><string>\x07</string></plist>",
         "The character with the code 7 is no part of a text.", 1, 16},
        {"what is no character", "<plist><string>\xEF\xBF\xBF</string></plist>",
         "The character with the code 65535 is no part of a text.", 1, 16},
    };
    for (const auto& row : rows) {
        test::expectProblem(examine(row.text), PropertyListFormat::Xml, row);
    }
}

}  // namespace
}  // namespace vlm::platform
