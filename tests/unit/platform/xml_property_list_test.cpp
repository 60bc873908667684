// The XML format, read. What is wrong in a document is in xml_property_list_problems_test.cpp, and
// how one is written in xml_property_list_writer_test.cpp.

#include <gtest/gtest.h>

#include <clocale>
#include <cmath>
#include <limits>

#include "binary_list.h"
#include "examined.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

constexpr double kInfinity = std::numeric_limits<double>::infinity();

using test::examine;
using test::examineXmlValue;

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
        test::expectValue(examineXmlValue(row.element), PropertyListFormat::Xml, row.value,
                          row.why);
    }
}

TEST(XmlPropertyListTest, ReadsWhatIsNoNumber) {
    for (const char* element : {"<real>nan</real>", "<real>NaN</real>"})
        EXPECT_TRUE(std::isnan(examineXmlValue(element).value.value().real().value())) << element;
}

TEST(XmlPropertyListTest, ReadsRealsWhereADecimalPointIsAComma) {
    const std::string before = std::setlocale(LC_ALL, nullptr);
    for (const char* locale : {"de_DE.UTF-8", "fr_FR.UTF-8", "nl_NL.UTF-8", "de_DE"})
        if (std::setlocale(LC_ALL, locale)) break;
    if (std::localeconv()->decimal_point != std::string_view(","))
        GTEST_SKIP() << "no locale with a decimal comma is installed";

    const auto withPoint = examineXmlValue("<real>1.5</real>").value;
    const auto withComma = examineXmlValue("<real>1,5</real>").value;
    std::setlocale(LC_ALL, before.c_str());

    EXPECT_EQ(withPoint, PropertyList(1.5));
    EXPECT_EQ(withComma, std::nullopt);
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
