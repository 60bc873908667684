// Lists that are made to cost their reader time or memory: an answer comes within a tenth of a
// second and 64 MiB, whatever they ask for.

#include <gtest/gtest.h>

#include "binary_list.h"
#include "measured_cost.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

constexpr std::size_t kDeep = 100000;

Bytes bytesOf(std::string_view text) { return {text.begin(), text.end()}; }

std::string times(std::size_t count, std::string_view text) {
    std::string all;
    all.reserve(count * text.size());
    while (count-- > 0) all += text;
    return all;
}

// Each array but the innermost holds the next one.
Bytes deepBinary() {
    Bytes list = fromHex("62 70 6C 69 73 74 30 30");
    for (std::size_t number = 0; number + 1 < kDeep; ++number) {
        list.push_back(0xA1);
        appendNumber(list, number + 1, 4);
    }
    list.push_back(0xA0);
    const std::size_t table = list.size();
    for (std::size_t number = 0; number < kDeep; ++number) appendNumber(list, 8 + number * 5, 4);
    append(list, fromHex("00 00 00 00 00 00 04 04"));
    for (const std::size_t number : {kDeep, std::size_t{0}, table}) appendNumber(list, number, 8);
    return list;
}

// 200 bytes whose trailer speaks of 2^60 objects of 16 bytes each.
Bytes claimsManyObjects() {
    Bytes list = fromHex("62 70 6C 69 73 74 30 30 09");
    list.resize(168);
    append(list, fromHex("00 00 00 00 00 00 08 08"));
    for (const std::uint64_t number : {std::uint64_t{1} << 60U, std::uint64_t{0}, std::uint64_t{9}})
        appendNumber(list, number, 8);
    return list;
}

// An array that says to have 2^60 elements, and a dictionary of as many entries inside one.
Bytes claimsManyElements() {
    return BinaryList{{"A1 01", "DF 13 10 00 00 00 00 00 00 00"}}.bytes();
}

Bytes doublingArrays() {
    Bytes list = fromHex("62 70 6C 69 73 74 30 30");
    for (std::size_t number = 0; number < 60; ++number) {
        list.push_back(0xA2);
        appendNumber(list, number + 1, 1);
        appendNumber(list, number + 1, 1);
    }
    list.push_back(0x09);
    const std::size_t table = list.size();
    for (std::size_t number = 0; number <= 60; ++number) appendNumber(list, 8 + number * 3, 1);
    append(list, fromHex("00 00 00 00 00 00 01 01"));
    for (const std::size_t number : {std::size_t{61}, std::size_t{0}, table})
        appendNumber(list, number, 8);
    return list;
}

std::string billionLaughs() {
    std::string text = "<?xml version=\"1.0\"?><!DOCTYPE plist [<!ENTITY lol0 \"lol\">";
    for (int level = 1; level < 10; ++level) {
        const std::string inner = "&lol" + std::to_string(level - 1) + ";";
        text += "<!ENTITY lol" + std::to_string(level) + " \"" + times(10, inner) + "\">";
    }
    return text + "]><plist><string>&lol9;</string></plist>";
}

TEST(PropertyListCostTest, StaysLowForListsThatMeanHarm) {
    struct {
        const char* why;
        Bytes data;
    } const rows[] = {
        {"a binary list that refers to itself", BinaryList{{"A2 00 00"}}.bytes()},
        {"a dictionary that refers to itself", BinaryList{{"D1 01 00", "51 61"}}.bytes()},
        {"200 bytes that ask for 2^60 objects", claimsManyObjects()},
        {"an object that asks for 2^60 entries", claimsManyElements()},
        {"a binary list that doubles sixty times", doublingArrays()},
        {"100,000 arrays in each other, binary", deepBinary()},
        {"100,000 arrays in each other, XML",
         bytesOf("<plist>" + times(kDeep, "<array>") + times(kDeep, "</array>") + "</plist>")},
        {"100,000 arrays in each other that do not end, XML",
         bytesOf("<plist>" + times(kDeep, "<array>"))},
        {"100,000 dictionaries in each other, XML",
         bytesOf("<plist>" + times(kDeep, "<dict><key>a</key>") + times(kDeep, "</dict>") +
                 "</plist>")},
        {"100,000 arrays in each other, text", bytesOf(times(kDeep, "(") + times(kDeep, ")"))},
        {"100,000 dictionaries in each other, text", bytesOf(times(kDeep, "{a="))},
        {"a billion laughs", bytesOf(billionLaughs())},
        {"an entity that holds itself",
         bytesOf("<!DOCTYPE plist [<!ENTITY a \"&a;\">]><plist><string>&a;</string></plist>")},
        {"brackets in a document type", bytesOf("<!DOCTYPE plist " + times(kDeep, "[<!"))},
        {"100,000 comments that do not end", bytesOf(times(kDeep, "/*"))},
        {"100,000 quotes", bytesOf("(" + times(kDeep, "\"\","))},
        {"100,000 attributes", bytesOf("<plist" + times(kDeep, " a=\"\"") + "><true/></plist>")},
    };
    ASSERT_EQ(rows[2].data.size(), 200u);
    for (const auto& row : rows) {
        const auto cost = test::measured([&] { return readPropertyList(row.data).has_value(); });
        ASSERT_TRUE(cost) << row.why;
        EXPECT_FALSE(cost->answer) << row.why;
        EXPECT_LT(cost->time.count(), 100000 * test::kTimeAllowance) << row.why;
        EXPECT_LT(cost->kibibytes, std::size_t{64} * 1024 * test::kMemoryAllowance) << row.why;
    }
}

// Nothing is built of a document with more elements than could be values.
TEST(PropertyListCostTest, StaysLowForXmlOfFarTooManyElements) {
    const Bytes data = bytesOf("<plist><array>" + times(std::size_t{8} << 20U, "<a/>"));

    const auto cost = test::measured([&] { return readPropertyList(data).has_value(); });

    ASSERT_TRUE(cost);
    EXPECT_FALSE(cost->answer);
    EXPECT_LT(cost->kibibytes, std::size_t{64} * 1024 * test::kMemoryAllowance);
}

// The work below has to be seen by the measure, or the tests above could not fail.
TEST(PropertyListCostTest, IsMeasured) {
    const auto cost = test::measured([] { return Bytes(std::size_t{100} << 20U, 1).back() == 1; });

    ASSERT_TRUE(cost);
    EXPECT_TRUE(cost->answer);
    EXPECT_GT(cost->kibibytes, std::size_t{90} * 1024);
    EXPECT_GT(cost->time.count(), 0);
}

}  // namespace
}  // namespace vlm::platform
