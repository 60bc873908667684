// The XML format, read. How it is written is in xml_property_list_writer_test.cpp.

#include <gtest/gtest.h>

#include <clocale>
#include <cmath>
#include <limits>

#include "binary_list.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

constexpr double kInfinity = std::numeric_limits<double>::infinity();

PropertyListExamination examine(std::string_view text, const PropertyListLimits& limits = {}) {
    return examinePropertyList(Bytes(text.begin(), text.end()), limits);
}

PropertyListExamination examineValue(std::string_view element) {
    return examine("<plist>" + std::string(element) + "</plist>");
}

TEST(XmlPropertyListTest, ReadsEveryKindOfValue) {
    struct {
        const char* why;
        const char* element;
        PropertyList value;
    } const rows[] = {
        {"true", "<true/>", true},
        {"false, with an end of its own", "<false> </false>", false},
        {"an integer", "<integer>7</integer>", 7},
        {"blanks around a number", "<integer>\n\t-7 \r\n</integer>", -7},
        {"a plus sign", "<integer>+7</integer>", 7},
        {"zeros in front", "<integer>007</integer>", 7},
        {"a hexadecimal integer", "<integer>0xfF</integer>", 255},
        {"another one", "<integer>-0X10</integer>", -16},
        {"the least integer", "<integer>-9223372036854775808</integer>", INT64_MIN},
        {"the greatest signed one", "<integer>9223372036854775807</integer>", INT64_MAX},
        {"the greatest one", "<integer>18446744073709551615</integer>", UINT64_MAX},
        {"the greatest hexadecimal one", "<integer>0xFFFFFFFFFFFFFFFF</integer>", UINT64_MAX},
        {"a real", "<real>1.5</real>", 1.5},
        {"a real without a fraction stays one", "<real> 1 </real>", 1.0},
        {"an exponent", "<real>-1.25e-3</real>", -0.00125},
        {"a plus sign of a real", "<real>+.5E+1</real>", 5.0},
        {"infinity", "<real>inf</real>", kInfinity},
        {"infinity at length", "<real>-Infinity</real>", -kInfinity},
        {"the first date", "<date>2001-01-01T00:00:00Z</date>", Date{0}},
        {"a date before it", "<date>2000-12-31T23:59:59Z</date>", Date{-1}},
        {"a leap day", "<date> 2008-02-29T12:34:56Z </date>", Date{225981296}},
        {"the earliest date", "<date>0001-01-01T00:00:00Z</date>", Date{-63113904000}},
        {"the latest date", "<date>9999-12-31T23:59:59Z</date>", Date{252423993599}},
        {"no data", "<data></data>", Bytes{}},
        {"data with one byte at the end", "<data>AQIDBA==</data>", Bytes{1, 2, 3, 4}},
        {"data with two", "<data>AQIDBAU=</data>", Bytes{1, 2, 3, 4, 5}},
        {"data in lines", "<data>\n\tAQ ID\r\n\t+/8=\n</data>", Bytes{1, 2, 3, 0xFB, 0xFF}},
        {"no text", "<string/>", ""},
        {"blanks in text", "<string> a\n\tb </string>", " a\n\tb "},
        {"nothing but blanks", "<string>  </string>", "  "},
        {"line breaks are line feeds", "<string>a\r\nb\rc\r\r\n</string>", "a\nb\nc\n\n"},
        {"but not those that are referred to", "<string>&#13;&#xA;</string>", "\r\n"},
        {"text that is not ASCII", "<string>caf\xC3\xA9 \xF0\x9F\x92\xB3</string>",
         "caf\xC3\xA9 \xF0\x9F\x92\xB3"},
        {"the entities of XML", "<string>&lt;&gt;&amp;&quot;&apos;</string>", "<>&\"'"},
        {"an entity is not resolved twice", "<string>&amp;lt;</string>", "&lt;"},
        {"references to characters", "<string>&#65;&#x1f4B3;&#0000066;</string>",
         "A\xF0\x9F\x92\xB3"
         "B"},
        {"CDATA", "<string>a<![CDATA[<b>&amp;\r\n]]> <![CDATA[]]>c</string>", "a<b>&amp;\n c"},
        {"comments are no text", "<string>a<!-- b -->c<?d e?>f</string>", "acf"},
        {"a number in pieces", "<integer>1<!-- 2 --><![CDATA[3]]></integer>", 13},
        {"an empty array", "<array/>", Array{}},
        {"an array", "<array> <true/>\n<integer>1</integer></array>", Array{true, 1}},
        {"an empty dictionary", "<dict></dict>", Dictionary{}},
        {"a dictionary in its order",
         "<dict><key>z</key><true/> <key>a</key><array><dict/></array></dict>",
         Dictionary{{"z", true}, {"a", Array{Dictionary{}}}}},
        {"a key with references", "<dict><key>a&amp;<![CDATA[<b>]]></key><true/></dict>",
         Dictionary{{"a&<b>", true}}},
        {"an empty key", "<dict><key/><true/></dict>", Dictionary{{"", true}}},
        {"comments between elements",
         "<!-- a --><dict><!-- b --><key>c</key><!-- d --><true/></dict><?e f?>",
         Dictionary{{"c", true}}},
        {"the last value of a key, in the place of the first",
         "<dict><key>a</key><integer>1</integer><key>b</key><integer>2</integer>"
         "<key>a</key><integer>3</integer></dict>",
         Dictionary{{"a", 3}, {"b", 2}}},
    };
    for (const auto& row : rows) {
        const auto found = examineValue(row.element);
        EXPECT_EQ(found.value, row.value) << row.why << ": " << found.problem;
        EXPECT_EQ(found.format, PropertyListFormat::Xml) << row.why;
        EXPECT_EQ(found.problem, "") << row.why;
        EXPECT_EQ(found.line, 0u) << row.why;
    }
}

TEST(XmlPropertyListTest, ReadsWhatIsNoNumber) {
    for (const char* element : {"<real>nan</real>", "<real>NaN</real>"})
        EXPECT_TRUE(std::isnan(examineValue(element).value.value().real().value())) << element;
}

TEST(XmlPropertyListTest, ReadsRealsInAnyLocale) {
    const std::string before = std::setlocale(LC_ALL, nullptr);
    for (const char* locale : {"de_DE.UTF-8", "fr_FR.UTF-8", "C.UTF-8"})
        if (std::setlocale(LC_ALL, locale)) break;

    EXPECT_EQ(examineValue("<real>1.5</real>").value, PropertyList(1.5));
    EXPECT_FALSE(examineValue("<real>1,5</real>").value);

    std::setlocale(LC_ALL, before.c_str());
}

TEST(XmlPropertyListTest, ReadsTheFrameThatDocumentsHave) {
    struct {
        const char* why;
        const char* text;
    } const rows[] = {
        {"nothing but the list", "<plist><true/></plist>"},
        {"a version", "<plist version='1.0'><true/></plist>"},
        {"a declaration", "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<plist><true/></plist>\n"},
        {"ASCII", "<?xml version=\"1.0\" encoding=\"US-ASCII\"?><plist><true/></plist>"},
        {"a mark", "\xEF\xBB\xBF<?xml version=\"1.0\"?><plist><true/></plist>"},
        {"blanks and comments around", " \n<!-- a --><plist><true/></plist>\n<!-- b -->\n"},
        {"a document type",
         "<?xml version=\"1.0\"?>\n<!DOCTYPE plist PUBLIC \"-//Example//DTD//EN\" "
         "\"http://localhost/list.dtd\">\n<plist version=\"1.0\"><true/></plist>"},
        {"a document type with declarations",
         "<!DOCTYPE plist [ <!ENTITY a \"b\"> <!ELEMENT plist ANY> <!-- ]> --> ]>"
         "<plist><true/></plist>"},
    };
    for (const auto& row : rows) {
        const auto found = examine(row.text);
        EXPECT_EQ(found.value, PropertyList(true)) << row.why << ": " << found.problem;
    }
}

TEST(XmlPropertyListTest, ReadsUtf16BehindAMark) {
    const std::string_view text = "<?xml version=\"1.0\" encoding=\"UTF-16\"?><plist><string>";
    for (const bool isBigEndian : {true, false}) {
        Bytes data = fromHex(isBigEndian ? "FE FF" : "FF FE");
        const auto append = [&](std::string_view ascii) {
            for (const char letter : ascii) {
                if (isBigEndian) data.push_back(0);
                data.push_back(static_cast<std::uint8_t>(letter));
                if (!isBigEndian) data.push_back(0);
            }
        };
        append(text);
        vlm::platform::append(
            data, fromHex(isBigEndian ? "00 E9 6C 34 D8 3D DC B3" : "E9 00 34 6C 3D D8 B3 DC"));
        append("</string></plist>");

        EXPECT_EQ(readPropertyList(data), PropertyList("\xC3\xA9\xE6\xB0\xB4\xF0\x9F\x92\xB3"));
    }
}

TEST(XmlPropertyListTest, ExpandsNoEntityOfADocument) {
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

TEST(XmlPropertyListTest, RefusesScalarsThatAreNone) {
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
        const auto found = examineValue(row.element);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_TRUE(found.problem.starts_with("This is no ") ||
                    found.problem.ends_with("holds no text."))
            << row.why << ": " << found.problem;
        EXPECT_EQ(found.column, 8u) << row.why;
    }
}

TEST(XmlPropertyListTest, TellsWhatIsWrongAndWhere) {
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
         "No value is written as the element \"???\".", 1, 8},
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
        const auto found = examine(row.text);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_EQ(found.format, PropertyListFormat::Xml) << row.why;
        EXPECT_EQ(found.problem, row.problem) << row.why;
        EXPECT_EQ(found.line, row.line) << row.why;
        EXPECT_EQ(found.column, row.column) << row.why;
    }
}

TEST(XmlPropertyListTest, KeepsToTheLimits) {
    struct {
        const char* why;
        const char* element;
        PropertyListLimits enough;
        PropertyListLimits tooFew;
        const char* problem;
    } const rows[] = {
        {"depth",
         "<array><dict><key>a</key><array/></dict></array>",
         {.depth = 3},
         {.depth = 2},
         "Arrays and dictionaries lie too deep inside each other."},
        {"values",
         "<array><true/><true/></array>",
         {.objects = 3},
         {.objects = 2},
         "There are more values than are read."},
        {"keys",
         "<dict><key>a</key><true/></dict>",
         {.objects = 3},
         {.objects = 2},
         "There are more values than are read."},
    };
    for (const auto& row : rows) {
        const std::string text = "<plist>" + std::string(row.element) + "</plist>";
        EXPECT_TRUE(examine(text, row.enough).value) << row.why;
        const auto found = examine(text, row.tooFew);
        EXPECT_FALSE(found.value) << row.why;
        EXPECT_EQ(found.problem, row.problem) << row.why;
    }
}

TEST(XmlPropertyListTest, CountsTheBytesThatValuesHold) {
    Bytes data = fromHex("FE FF 00 3C 00 70 00 6C 00 69 00 73 00 74 00 3E");   // <plist>
    append(data, fromHex("00 3C 00 73 00 74 00 72 00 69 00 6E 00 67 00 3E"));  // <string>
    for (int times = 0; times < 200; ++times) append(data, fromHex("6C 34"));
    append(data, fromHex("00 3C 00 2F 00 73 00 74 00 72 00 69 00 6E 00 67 00 3E"));  // </string>
    append(data, fromHex("00 3C 00 2F 00 70 00 6C 00 69 00 73 00 74 00 3E"));        // </plist>

    EXPECT_TRUE(readPropertyList(data, {.bytes = 600}));
    EXPECT_EQ(examinePropertyList(data, {.bytes = 599}).problem,
              "There is more text and data than is read.");
}

}  // namespace
}  // namespace vlm::platform
