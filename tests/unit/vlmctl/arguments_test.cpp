#include "services/vlmctl/arguments.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace vlm::control {
namespace {

using testing::HasSubstr;
using Words = std::vector<std::string>;

struct Row {
    const char* why;
    Words words;
    Command command;
    Words operands;
};

TEST(ControlArguments, NameACommandAndWhatItIsAbout) {
    const Row rows[] = {
        {"a command alone", {"settings"}, Command::Settings, {}},
        {"one operand", {"get", "UserPairing"}, Command::Get, {"UserPairing"}},
        {"two operands", {"set", "UserPairing", "off"}, Command::Set, {"UserPairing", "off"}},
        {"removal", {"unset", "UserPairing"}, Command::Unset, {"UserPairing"}},
        {"a file", {"check", "/etc/a.plist"}, Command::Check, {"/etc/a.plist"}},
        {"a dash alone is a file", {"check", "-"}, Command::Check, {"-"}},
        {"a file like an option", {"check", "--", "--json"}, Command::Check, {"--json"}},
        {"cards", {"tokens"}, Command::Tokens, {}},
        {"pairings", {"pairings"}, Command::Pairings, {}},
        {"an empty operand is one", {"set", "UserPairing", ""}, Command::Set, {"UserPairing", ""}},
    };
    for (const auto& [why, words, command, operands] : rows) {
        SCOPED_TRACE(why);

        const auto parsed = parseArguments(words);

        ASSERT_TRUE(parsed.arguments) << parsed.text;
        EXPECT_EQ(parsed.arguments->command, command);
        EXPECT_EQ(parsed.arguments->operands, operands);
    }
}

TEST(ControlArguments, AskForATableWithHeadingsUnlessToldOtherwise) {
    const auto parsed = parseArguments({"tokens"});

    ASSERT_TRUE(parsed.arguments);
    EXPECT_FALSE(parsed.arguments->json);
    EXPECT_TRUE(parsed.arguments->legend);
    EXPECT_EQ(parsed.arguments->user, std::nullopt);
    EXPECT_EQ(parsed.arguments->database, std::nullopt);
}

TEST(ControlArguments, TakeOptionsAnywhereAndValuesInEachForm) {
    const Words rows[] = {
        {"--json", "--no-legend", "--user", "al", "--database", "/d", "pairings"},
        {"pairings", "--json", "--no-legend", "--user=al", "--database=/d"},
        {"-u", "al", "pairings", "--database", "/d", "--json", "--no-legend"},
        {"-ual", "--database=/d", "--json", "pairings", "--no-legend"},
        {"--user=bob", "pairings", "--user=al", "--database=/d", "--json", "--no-legend"},
    };
    for (const auto& words : rows) {
        SCOPED_TRACE(testing::PrintToString(words));

        const auto parsed = parseArguments(words);

        ASSERT_TRUE(parsed.arguments) << parsed.text;
        EXPECT_EQ(parsed.arguments->user, "al");
        EXPECT_EQ(parsed.arguments->database, "/d");
        EXPECT_TRUE(parsed.arguments->json);
        EXPECT_FALSE(parsed.arguments->legend);
    }
}

struct Wrong {
    const char* why;
    Words words;
    const char* named;
};

TEST(ControlArguments, RefuseWhatTheyDoNotUnderstand) {
    const Wrong rows[] = {
        {"nothing", {}, "a command is needed"},
        {"options only", {"--json"}, "a command is needed"},
        {"an unknown command", {"list"}, "list"},
        {"commands are lower-case", {"Get", "UserPairing"}, "Get"},
        {"a missing operand", {"set", "UserPairing"}, "KEY VALUE"},
        {"an operand too many", {"get", "a", "b"}, "KEY"},
        {"an operand where none belongs", {"tokens", "a"}, "nothing"},
        {"an unknown option", {"tokens", "--fast"}, "--fast"},
        {"an unknown letter", {"tokens", "-x"}, "-x"},
        {"a value where none belongs", {"tokens", "--json=1"}, "--json takes no value"},
        {"a user that is missing", {"settings", "--user"}, "--user needs a value"},
        {"a user that is empty", {"settings", "--user="}, "--user needs a value"},
        {"a user of a command about the machine", {"set", "-u", "a", "k", "v"}, "--user"},
        {"a user of the cards", {"tokens", "--user", "a"}, "--user"},
        {"a database of the cards", {"tokens", "--database", "/a"}, "--database"},
        {"behind two dashes nothing is an option", {"tokens", "--", "--json"}, "nothing"},
    };
    for (const auto& [why, words, named] : rows) {
        SCOPED_TRACE(why);

        const auto parsed = parseArguments(words);

        EXPECT_FALSE(parsed.arguments);
        EXPECT_EQ(parsed.exitStatus, 2);
        EXPECT_THAT(parsed.text, HasSubstr(named));
        EXPECT_THAT(parsed.text, HasSubstr("vlmctl --help"));
    }
}

TEST(ControlArguments, HelpNamesEveryCommandAndOption) {
    for (const char* word : {"--help", "-h"}) {
        const auto help = parseArguments({"tokens", word, "--no-such-option"});

        EXPECT_FALSE(help.arguments);
        EXPECT_EQ(help.exitStatus, 0);
        for (const char* named :
             {"settings", "get KEY", "set KEY VALUE", "unset KEY", "check FILE", "tokens",
              "pairings", "--user", "--database", "--json", "--no-legend", "--version"})
            EXPECT_THAT(help.text, HasSubstr(named));
    }
}

TEST(ControlArguments, TellTheVersion) {
    const auto version = parseArguments({"--version"});

    EXPECT_EQ(version.exitStatus, 0);
    EXPECT_THAT(version.text, testing::MatchesRegex("vlmctl [0-9]+\\.[0-9]+\\.[0-9]+\n"));
}

}  // namespace
}  // namespace vlm::control
