#include "services/vlmctl/property_list_check.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>

namespace vlm::control {
namespace {

using platform::PropertyList;
using Dictionary = PropertyList::Dictionary;
using testing::HasSubstr;

CheckReport check(const PropertyList& list, FileRole role = FileRole::Unknown) {
    return checkPropertyList(*platform::writeBinaryPropertyList(list), role);
}

struct Row {
    const char* why;
    PropertyList value;
    const char* problem;  // empty when there is none
};

TEST(PropertyListCheck, TakesABooleanOrANumberForASetting) {
    const Row rows[] = {
        {"a boolean", true, ""},
        {"a number", 5, ""},
        {"a number below zero", -1, ""},
        {"a real", 1.5, ""},
        {"text", "1", "is text, and counts as absent"},
        {"data", platform::Bytes{1}, "is data, and counts as absent"},
        {"a date", PropertyList::Date{0}, "is a date, and counts as absent"},
        {"an array", PropertyList::Array{}, "is an array, and counts as absent"},
        {"a dictionary", Dictionary{}, "is a dictionary, and counts as absent"},
    };
    for (const auto& [why, value, problem] : rows) {
        SCOPED_TRACE(why);

        const auto report = check(Dictionary{{"UserPairing", value}});

        EXPECT_EQ(report.hasProblems(), *problem != '\0');
        ASSERT_EQ(report.findings.size(), *problem == '\0' ? 0U : 1U);
        if (*problem) {
            EXPECT_THAT(report.findings[0].text, HasSubstr(problem));
        }
    }
}

TEST(PropertyListCheck, WarnsOfANumberThatIsCut) {
    const std::int64_t most = std::numeric_limits<std::int32_t>::max();
    EXPECT_TRUE(check(Dictionary{{"UserPairing", most}}).findings.empty());
    EXPECT_TRUE(check(Dictionary{{"UserPairing", -most - 1}}).findings.empty());

    for (const PropertyList& wide :
         {PropertyList(most + 1), PropertyList(-most - 2), PropertyList(std::uint64_t{1} << 63U)}) {
        const auto report = check(Dictionary{{"UserPairing", wide}});

        EXPECT_FALSE(report.hasProblems());
        ASSERT_EQ(report.findings.size(), 1U);
        EXPECT_THAT(report.findings[0].text, HasSubstr("does not fit in 32 bits"));
    }
}

TEST(PropertyListCheck, WarnsOfAnUnknownKeyAndHintsAtTheNearest) {
    const auto report = check(Dictionary{{"alowSmartCard", true}, {"colour", "blue"}});

    EXPECT_FALSE(report.hasProblems());
    ASSERT_EQ(report.findings.size(), 2U);
    EXPECT_TRUE(report.findings[0].isWarning);
    EXPECT_EQ(report.findings[0].text,
              "\"alowSmartCard\" is no known key; did you mean \"allowSmartCard\"?");
    EXPECT_EQ(report.findings[1].text, "\"colour\" is no known key, and is not read");
}

TEST(PropertyListCheck, KnowsTheMappingOfTheConfigurationFileWithAnyValue) {
    for (const PropertyList& value : {PropertyList(true), PropertyList(Dictionary{{"a", "b"}})}) {
        EXPECT_TRUE(check(Dictionary{{"AttributeMapping", value}}, FileRole::Configuration)
                        .findings.empty());
        EXPECT_TRUE(check(Dictionary{{"AttributeMapping", value}}).findings.empty());
    }
}

TEST(PropertyListCheck, WarnsOfAKeyThatTheFileIsNotReadFor) {
    const auto mapping = check(Dictionary{{"AttributeMapping", true}}, FileRole::Settings);
    const auto setting = check(Dictionary{{"UserPairing", true}}, FileRole::Configuration);

    EXPECT_FALSE(mapping.hasProblems());
    ASSERT_EQ(mapping.findings.size(), 1U);
    EXPECT_THAT(mapping.findings[0].text, HasSubstr("/etc/SmartcardLogin.plist only"));
    EXPECT_FALSE(setting.hasProblems());
    ASSERT_EQ(setting.findings.size(), 1U);
    EXPECT_THAT(setting.findings[0].text, HasSubstr("\"vlmctl set\" sets it"));
}

TEST(PropertyListCheck, WantsADictionaryAtTheTop) {
    const auto report = check(PropertyList::Array{true});

    EXPECT_TRUE(report.hasProblems());
    ASSERT_EQ(report.findings.size(), 1U);
    EXPECT_THAT(report.findings[0].text, HasSubstr("the top level is an array"));
    EXPECT_THAT(check(true).findings[0].text, HasSubstr("the top level is a boolean"));
}

TEST(PropertyListCheck, CountsTheKeys) {
    EXPECT_EQ(check(Dictionary{}).keys, 0U);
    EXPECT_EQ(check(Dictionary{{"UserPairing", true}, {"useLocalOd", false}}).keys, 2U);
    EXPECT_FALSE(check(Dictionary{}).hasProblems());
}

TEST(PropertyListCheck, TellsWhereAListIsBroken) {
    const std::string text =
        "<plist version=\"1.0\">\n<dict>\n  <key>a</wrong>\n</dict>\n</plist>\n";
    const platform::Bytes data(text.begin(), text.end());

    const auto report = checkPropertyList(data, FileRole::Unknown);

    EXPECT_TRUE(report.hasProblems());
    ASSERT_EQ(report.findings.size(), 1U);
    EXPECT_EQ(report.format, platform::PropertyListFormat::Xml);
    EXPECT_EQ(report.findings[0].line, 3U);
    EXPECT_NE(report.findings[0].column, 0U);
    EXPECT_NE(report.findings[0].text, "");
}

TEST(FileRoleTest, GoesByTheNameOfTheFileInAnyFolder) {
    EXPECT_EQ(roleOf("/etc/SmartcardLogin.plist"), FileRole::Configuration);
    EXPECT_EQ(roleOf("SmartcardLogin.plist"), FileRole::Configuration);
    EXPECT_EQ(roleOf("/etc/vlm/managed/org.vlm.smartcard.plist"), FileRole::Settings);
    EXPECT_EQ(roleOf("draft.plist"), FileRole::Unknown);
    EXPECT_EQ(roleOf("-"), FileRole::Unknown);
    EXPECT_EQ(roleOf("/etc/SmartcardLogin.plist/a"), FileRole::Unknown);
}

}  // namespace
}  // namespace vlm::control
