// The XML format, written for people.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

constexpr double kInfinity = std::numeric_limits<double>::infinity();

std::optional<PropertyList> read(const std::string& text) {
    return readPropertyList(Bytes(text.begin(), text.end()));
}

TEST(XmlPropertyListWriterTest, IndentsWhatLiesInside) {
    const PropertyList value = Dictionary{
        {"z", Array{true, Array{}, Dictionary{}}},
        {"a & b", Dictionary{{"data", Bytes{1, 2, 3, 4}}}},
    };

    EXPECT_EQ(writeXmlPropertyList(value), R"(<?xml version="1.0" encoding="UTF-8"?>
<plist version="1.0">
<dict>
	<key>z</key>
	<array>
		<true/>
		<array>
		</array>
		<dict>
		</dict>
	</array>
	<key>a &amp; b</key>
	<dict>
		<key>data</key>
		<data>
		AQIDBA==
		</data>
	</dict>
</dict>
</plist>
)");
}

TEST(XmlPropertyListWriterTest, WritesEveryScalar) {
    struct {
        const char* why;
        PropertyList value;
        const char* element;
    } const rows[] = {
        {"true", true, "<true/>"},
        {"false", false, "<false/>"},
        {"an integer", -7, "<integer>-7</integer>"},
        {"the greatest integer", UINT64_MAX, "<integer>18446744073709551615</integer>"},
        {"a real that is whole", 1.0, "<real>1</real>"},
        {"a real, as short as it can be told", 0.1, "<real>0.1</real>"},
        {"a real of every digit", 1.0 / 3, "<real>0.3333333333333333</real>"},
        {"the least real", 5e-324, "<real>5e-324</real>"},
        {"minus zero", -0.0, "<real>-0</real>"},
        {"infinity", -kInfinity, "<real>-inf</real>"},
        {"a date", Date{225981296}, "<date>2008-02-29T12:34:56Z</date>"},
        {"the earliest date", Date{-63113904000}, "<date>0001-01-01T00:00:00Z</date>"},
        {"the latest date", Date{252423993599}, "<date>9999-12-31T23:59:59Z</date>"},
        {"no text", "", "<string></string>"},
        {"text", "<a> & \"b\"\t\n", "<string>&lt;a&gt; &amp; \"b\"\t\n</string>"},
        {"a carriage return", "a\r\n", "<string>a&#13;\n</string>"},
        {"text that is not ASCII", "\xC3\xA9\x7F\xF0\x9F\x92\xB3",
         "<string>\xC3\xA9\x7F\xF0\x9F\x92\xB3</string>"},
        {"no data", Bytes{}, "<data>\n</data>"},
    };
    for (const auto& row : rows) {
        const auto text = writeXmlPropertyList(row.value);
        ASSERT_TRUE(text) << row.why;
        EXPECT_NE(text->find("\n" + std::string(row.element) + "\n</plist>"), std::string::npos)
            << row.why << ": " << *text;
        EXPECT_EQ(read(*text), row.value) << row.why;
    }
}

TEST(XmlPropertyListWriterTest, WritesWhatIsNoNumber) {
    for (const double sign : {1.0, -1.0}) {
        const auto text =
            writeXmlPropertyList(std::copysign(std::numeric_limits<double>::quiet_NaN(), sign));
        ASSERT_TRUE(text);
        EXPECT_NE(text->find("<real>nan</real>"), std::string::npos);
        EXPECT_TRUE(std::isnan(read(*text).value().real().value()));
    }
}

TEST(XmlPropertyListWriterTest, WritesDataInLines) {
    const Bytes bytes(58, 0);

    const std::string text = writeXmlPropertyList(bytes).value();

    EXPECT_NE(text.find("<data>\n" + std::string(76, 'A') + "\nAA==\n</data>\n"), std::string::npos)
        << text;
    EXPECT_EQ(read(text), PropertyList(bytes));
}

TEST(XmlPropertyListWriterTest, WritesDataOfEveryLength) {
    for (std::size_t size = 0; size < 200; ++size) {
        Bytes bytes(size);
        for (std::size_t at = 0; at < size; ++at)
            bytes[at] = static_cast<std::uint8_t>(255 - at * 7);
        EXPECT_EQ(read(writeXmlPropertyList(bytes).value()), PropertyList(bytes)) << size;
    }
}

TEST(XmlPropertyListWriterTest, HasNoFormForSomeValues) {
    struct {
        const char* why;
        PropertyList value;
    } const rows[] = {
        {"a control character", "a\x1B"},
        {"a zero character", std::string(1, '\0')},
        {"what is no character", "\xEF\xBF\xBE"},
        {"text that is not UTF-8", "\xFF"},
        {"a surrogate", "\xED\xA0\xBD"},
        {"part of a second", Date{0.5}},
        {"a date before the calendar", Date{-63113904001}},
        {"a date after the calendar", Date{252423993600}},
        {"a date without end", Date{kInfinity}},
        {"a date that is no number", Date{std::numeric_limits<double>::quiet_NaN()}},
    };
    for (const auto& row : rows) {
        EXPECT_FALSE(writeXmlPropertyList(row.value)) << row.why;
        EXPECT_FALSE(writeXmlPropertyList(Array{true, row.value})) << row.why << ", in an array";
        EXPECT_FALSE(writeXmlPropertyList(Dictionary{{"a", row.value}})) << row.why << ", as value";
        if (const auto* text = row.value.text()) {
            EXPECT_FALSE(writeXmlPropertyList(Dictionary{{*text, true}})) << row.why << ", as key";
        }
    }
}

TEST(XmlPropertyListWriterTest, KeepsToTheLimits) {
    const PropertyList value = Dictionary{{"key", Array{"text", Bytes{1}}}};
    const std::string text = writeXmlPropertyList(value).value();

    EXPECT_TRUE(writeXmlPropertyList(value, {.depth = 2, .objects = 5, .bytes = text.size()}));
    EXPECT_FALSE(writeXmlPropertyList(value, {.depth = 1}));
    EXPECT_FALSE(writeXmlPropertyList(value, {.objects = 4}));
    EXPECT_FALSE(writeXmlPropertyList(value, {.bytes = text.size() - 1}));
    EXPECT_FALSE(writeXmlPropertyList(value, {.bytes = 1}));
    EXPECT_FALSE(writeXmlPropertyList(Dictionary{}, {.depth = 0}));
    EXPECT_FALSE(writeXmlPropertyList(Array{}, {.depth = 0}));
    EXPECT_TRUE(readPropertyList(Bytes(text.begin(), text.end()),
                                 {.depth = 2, .objects = 5, .bytes = text.size()}));
}

}  // namespace
}  // namespace vlm::platform
