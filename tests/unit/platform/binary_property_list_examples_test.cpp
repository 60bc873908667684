// Whole lists, byte for byte, that were worked out from the format: data/binary_property_lists.txt.

#include <gtest/gtest.h>

#include <fstream>
#include <limits>
#include <map>
#include <sstream>

#include "binary_list.h"
#include "platform/property_list.h"

namespace vlm::platform {
namespace {

using Array = PropertyList::Array;
using Date = PropertyList::Date;
using Dictionary = PropertyList::Dictionary;

struct Example {
    bool isWritten = false;  // and not only read
    Bytes bytes;
};

// "AB 01*3": a byte, and another one three times.
void appendBytes(Bytes& bytes, const std::string& line) {
    std::istringstream words(line.substr(0, line.find('|')));
    for (std::string word; words >> word;) {
        const auto star = word.find('*');
        const std::size_t times = star == std::string::npos ? 1 : std::stoul(word.substr(star + 1));
        const Bytes byte = fromHex(word.substr(0, 2));
        ASSERT_EQ(byte.size(), 1u) << line;
        bytes.insert(bytes.end(), times, byte.front());
    }
}

std::map<std::string, Example> examples() {
    std::map<std::string, Example> examples;
    Example* current = nullptr;
    std::ifstream file(VLM_BINARY_PROPERTY_LISTS);
    for (std::string line; std::getline(file, line);) {
        if (line.empty() || line.starts_with('#')) continue;
        if (line.starts_with(' ')) {
            appendBytes(current->bytes, line);
            continue;
        }
        const auto colon = line.find(": ");
        current = &examples[line.substr(colon + 2)];
        current->isWritten = line.substr(0, colon) == "both";
    }
    return examples;
}

const std::map<std::string, PropertyList> kValues = {
    {"false", false},
    {"true", true},
    {"zero", 0},
    {"the greatest of one byte", 255},
    {"the least of two bytes", 256},
    {"the greatest of two bytes", 65535},
    {"the least of four bytes", 65536},
    {"the greatest of four bytes", std::int64_t{4294967295}},
    {"the least positive of eight bytes", std::int64_t{4294967296}},
    {"the greatest of eight bytes", INT64_MAX},
    {"minus one", -1},
    {"the least of eight bytes", INT64_MIN},
    {"the least of sixteen bytes", std::uint64_t{9223372036854775808U}},
    {"the greatest of sixteen bytes", UINT64_MAX},
    {"seven in two bytes", 7},
    {"seven in four bytes", 7},
    {"seven in eight bytes", 7},
    {"minus seven in sixteen bytes", -7},
    {"one and a half", 1.5},
    {"minus a tenth", -0.1},
    {"without end", std::numeric_limits<double>::infinity()},
    {"minus two and a half in four bytes", -2.5},
    {"the first second of 2001", Date{0}},
    {"a day later", Date{86400}},
    {"half a second before", Date{-0.5}},
    {"no bytes", Bytes{}},
    {"three bytes", Bytes{1, 2, 255}},
    {"fourteen bytes", Bytes(14, 0xAB)},
    {"fifteen bytes", Bytes(15, 0xAB)},
    {"a count of two bytes", Bytes(256, 0xAB)},
    {"a count of four bytes", Bytes{0xAB, 0xCD}},
    {"a count of eight bytes", Bytes{0xAB, 0xCD}},
    {"no text", ""},
    {"ASCII text", "Az~"},
    {"fifteen ASCII characters", "0123456789ABCDE"},
    {"a character of Latin 1", "\xC3\xA9"},
    {"ASCII beside another character", "a\xE6\xB0\xB4"},
    {"a character beyond 16 bits", "\xF0\x9F\x92\xB3"},
    {"fifteen units of UTF-16",
     "\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9"
     "\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9"},
    {"ASCII in UTF-16", "ab"},
    {"an empty array", Array{}},
    {"one element", Array{true}},
    {"fifteen elements", Array(15, false)},
    {"an empty dictionary", Dictionary{}},
    {"one entry", Dictionary{{"a", 5}}},
    {"two entries in their order", Dictionary{{"b", true}, {"a", false}}},
    {"an array in a dictionary", Dictionary{{"a", Array{Bytes{0xFF}}}}},
    {"a shared text", Array{"x", "x"}},
    {"a key of two dictionaries", Dictionary{{"a", Dictionary{{"a", 1}}}}},
    {"a shared array", Array{Array{true}, Array{true}}},
    {"offsets of two bytes", Bytes(245, 0xAB)},
    {"offsets of four bytes", Bytes(65524, 0xAB)},
    {"offsets of eight bytes", Array{true}},
    {"offsets of three bytes", Array{true}},
    {"references of two bytes", Dictionary{{"a", true}}},
    {"references of four bytes", Dictionary{{"a", true}}},
    {"references of eight bytes", Dictionary{{"a", true}}},
    {"the top object at the end", Array{true}},
};

TEST(BinaryPropertyListExamplesTest, HaveAValueEach) {
    const auto all = examples();
    EXPECT_EQ(all.size(), kValues.size());
    for (const auto& [name, value] : kValues) EXPECT_TRUE(all.contains(name)) << name;
}

TEST(BinaryPropertyListExamplesTest, AreReadAsTheirValues) {
    for (const auto& [name, example] : examples())
        EXPECT_EQ(readPropertyList(example.bytes), kValues.at(name)) << name;
}

TEST(BinaryPropertyListExamplesTest, AreWhatIsWrittenOfTheirValues) {
    for (const auto& [name, example] : examples()) {
        if (!example.isWritten) continue;
        EXPECT_EQ(writeBinaryPropertyList(kValues.at(name)), example.bytes) << name;
    }
}

}  // namespace
}  // namespace vlm::platform
