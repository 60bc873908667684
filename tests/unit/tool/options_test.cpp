#include "tool/options.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "arguments.h"

namespace vlm {
namespace {

using Found = std::vector<std::pair<char, std::string>>;

// Everything that the reader finds in a command line; the parser's own complaints are kept apart.
Found readAll(const std::vector<std::string>& options, std::string* complaints = nullptr) {
    fakes::Arguments arguments(options);
    testing::internal::CaptureStderr();
    Found found;
    OptionReader reader(arguments.count(), arguments.values());
    while (const auto option = reader.next()) found.emplace_back(option->letter, option->argument);
    const auto said = testing::internal::GetCapturedStderr();
    if (complaints) *complaints = said;
    return found;
}

struct Row {
    std::vector<std::string> arguments;
    Found found;
    const char* why;
};

TEST(OptionReader, ReadsAsThePosixParserDoes) {
    const Row rows[] = {
        {{"-i", "-p", "-r", "-v", "-f"},
         {{'i', ""}, {'p', ""}, {'r', ""}, {'v', ""}, {'f', ""}},
         "the options without an argument"},
        {{"-u", "alice", "-h", "AB", "-s", "status"},
         {{'u', "alice"}, {'h', "AB"}, {'s', "status"}},
         "the options with one"},
        {{"-ualice", "-hAB"}, {{'u', "alice"}, {'h', "AB"}}, "an argument joined to its option"},
        {{"-prv"}, {{'p', ""}, {'r', ""}, {'v', ""}}, "options joined to one another"},
        {{"-pu", "alice"}, {{'p', ""}, {'u', "alice"}}, "the last of several takes the argument"},
        {{"-u", "-p"}, {{'u', "-p"}}, "an argument may look like an option"},
        {{"-u", ""}, {{'u', ""}}, "an empty argument"},
        {{"-u", "a", "-u", "b"}, {{'u', "a"}, {'u', "b"}}, "an option that comes twice"},
        {{"status", "-p"}, {}, "nothing is an option behind the first argument that is none"},
        {{"-v", "status", "-p"}, {{'v', ""}}, "likewise in the middle"},
        {{"-v", "--", "-p"}, {{'v', ""}}, "two dashes end the options"},
        {{"-v", "-", "-p"}, {{'v', ""}}, "a dash alone is no option"},
        {{}, {}, "no arguments"},
    };
    for (const auto& row : rows) {
        std::string complaints;
        EXPECT_EQ(readAll(row.arguments, &complaints), row.found) << row.why;
        EXPECT_EQ(complaints, "") << row.why;
    }
}

TEST(OptionReader, LetsTheParserComplainAboutALetterItDoesNotKnow) {
    std::string complaints;

    EXPECT_EQ(readAll({"-x", "-v"}, &complaints), (Found{{'?', ""}, {'v', ""}}));

    EXPECT_EQ(complaints, "vlmbind: invalid option -- 'x'\n");
}

TEST(OptionReader, LetsTheParserComplainAboutAMissingArgument) {
    std::string complaints;

    EXPECT_EQ(readAll({"-v", "-u"}, &complaints), (Found{{'v', ""}, {'?', ""}}));

    EXPECT_EQ(complaints, "vlmbind: option requires an argument -- 'u'\n");
}

TEST(OptionReader, StartsOverForEachCommandLineAlsoWhenTheLastOneWasLeftHalfway) {
    fakes::Arguments joined({"-rrrr"});
    OptionReader(joined.count(), joined.values()).next();

    EXPECT_EQ(readAll({"-v"}), (Found{{'v', ""}}));
}

TEST(Options, AskForNothingAtFirst) {
    const Options options;

    EXPECT_EQ(options.userName, std::nullopt);
    EXPECT_EQ(options.publicKeyHash, std::nullopt);
    EXPECT_EQ(options.pairingUi, std::nullopt);
    EXPECT_FALSE(options.pair);
    EXPECT_FALSE(options.unpair);
    EXPECT_FALSE(options.pairingUiCommand);
    EXPECT_FALSE(options.verbose);
}

}  // namespace
}  // namespace vlm
