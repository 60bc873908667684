// Lists whose every byte was worked out by hand: so the codec is held to the format, not to itself.

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <set>
#include <sstream>
#include <stdexcept>

#include "binary_example_file.h"

namespace vlm::platform {
namespace {

class BinaryExamplesTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::ifstream file(VLM_BINARY_EXAMPLES);
        ASSERT_TRUE(file) << VLM_BINARY_EXAMPLES;
        ASSERT_NO_THROW(_examples = readBinaryExamples(file));
    }

    template <typename Check>
    void forEach(ExampleForm form, Check check) {
        std::size_t found = 0;
        for (const auto& example : _examples) {
            if (example.form != form) continue;
            SCOPED_TRACE(example.name + ": " + example.why);
            check(example);
            ++found;
        }
        EXPECT_GT(found, 0u);
    }

    std::vector<BinaryExample> _examples;
};

// Not by EXPECT_EQ, which would print megabytes.
void expectRead(const BinaryExample& example) {
    const auto value = readPropertyList(example.bytes);
    ASSERT_TRUE(value);
    EXPECT_TRUE(value == example.value) << value->describe().substr(0, 200);
}

TEST_F(BinaryExamplesTest, AreReadAsTheValuesThatTheyHold) {
    forEach(ExampleForm::Canonical, expectRead);
    forEach(ExampleForm::Readable, expectRead);
}

TEST_F(BinaryExamplesTest, AreWrittenToTheByteWhereTheyAreCanonical) {
    forEach(ExampleForm::Canonical, [](const BinaryExample& example) {
        const auto written = writeBinaryPropertyList(*example.value);
        ASSERT_TRUE(written);
        ASSERT_EQ(written->size(), example.bytes.size());
        const auto [made, expected] = std::ranges::mismatch(*written, example.bytes);
        EXPECT_TRUE(made == written->end()) << "at " << made - written->begin() << ": "
                                            << unsigned{*made} << " for " << unsigned{*expected};
    });
}

// One that is not, but does what it is there for, would otherwise be in the wrong class.
TEST_F(BinaryExamplesTest, AreWrittenAnotherWayWhereTheyAreNotCanonical) {
    forEach(ExampleForm::Readable, [](const BinaryExample& example) {
        EXPECT_FALSE(writeBinaryPropertyList(*example.value) == example.bytes);
    });
}

TEST_F(BinaryExamplesTest, AreRefusedWhereTheyAreMalformed) {
    forEach(ExampleForm::Malformed,
            [](const BinaryExample& example) { EXPECT_FALSE(readPropertyList(example.bytes)); });
}

TEST_F(BinaryExamplesTest, HaveNamesOfTheirOwn) {
    std::set<std::string> names;
    for (const auto& example : _examples)
        EXPECT_TRUE(names.insert(example.name).second) << example.name;
}

TEST(BinaryExampleNotationTest, HasAFormForEveryKindOfValue) {
    using Array = PropertyList::Array;
    using Date = PropertyList::Date;
    using Dictionary = PropertyList::Dictionary;
    struct {
        const char* notation;
        PropertyList value;
    } const rows[] = {
        {"true", true},
        {"-7", -7},
        {"18446744073709551615", UINT64_MAX},
        {"real 1.5", 1.5},
        {"real 1", 1.0},
        {"date -0.5", Date{-0.5}},
        {"<>", Bytes{}},
        {"<0A FF*2>", Bytes{10, 255, 255}},
        {"\"\"", ""},
        {R"("a\"\\\x0A")", "a\"\\\n"},
        {"\"ab\"*2", "abab"},
        {"[]", Array{}},
        {"[1, [true]*2]", Array{1, Array{true}, Array{true}}},
        {"{}", Dictionary{}},
        {R"({"b": 1, "a": {}})", Dictionary{{"b", 1}, {"a", Dictionary{}}}},
    };
    for (const auto& row : rows) EXPECT_EQ(exampleValue(row.notation), row.value) << row.notation;
}

TEST(BinaryExampleNotationTest, RefusesWhatStandsForNoValue) {
    for (const char* notation : {"", "x", "1 ", "real", "<0>", "<0a>", "\"a", "\"\\", "\"\\x1",
                                 "[1", "[1,2]", "{1: 2}", "{\"a\" 1}", R"({"a": 1, "a": 2})"})
        EXPECT_FALSE(exampleValue(notation)) << notation;
}

TEST(BinaryExampleNotationTest, CountsBytesUp) {
    Bytes bytes;

    EXPECT_TRUE(appendToken(bytes, "0102*2"));
    EXPECT_TRUE(appendToken(bytes, "00FF..0101"));
    EXPECT_TRUE(appendToken(bytes, "08..0E+3"));

    EXPECT_EQ(bytes, (Bytes{1, 2, 1, 2, 0, 255, 1, 0, 1, 1, 8, 11, 14}));
    for (const char* token : {"", "0", "0g", "01*", "01*x", "01..", "01..0203", "01..02+0"})
        EXPECT_FALSE(appendToken(bytes, token)) << token;
}

TEST(BinaryExampleNotationTest, FindsMistakesInTheFile) {
    struct {
        const char* why;
        const char* file;
    } const rows[] = {
        {"no name", "why: x\n"},
        {"no why", "name: x\nform: malformed\n"},
        {"no form", "name: x\nwhy: x\n"},
        {"an unknown form", "name: x\nwhy: x\nform: x\n"},
        {"an unknown field", "name: x\nwhy: x\nform: malformed\nx: x\n"},
        {"no value", "name: x\nwhy: x\nform: readable\n"},
        {"a broken value", "name: x\nwhy: x\nform: readable\nvalue: x\n"},
        {"a malformed one with a value", "name: x\nwhy: x\nform: malformed\nvalue: 1\n"},
        {"a wrong offset", "name: x\nwhy: x\nform: malformed\n  00: 01\n  02: 01\n"},
        {"a broken byte", "name: x\nwhy: x\nform: malformed\n  00: 0\n"},
    };
    for (const auto& row : rows) {
        std::istringstream file(row.file);
        EXPECT_THROW(readBinaryExamples(file), std::runtime_error) << row.why;
    }
}

}  // namespace
}  // namespace vlm::platform
