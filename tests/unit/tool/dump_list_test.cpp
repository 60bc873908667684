#include <sstream>

#include "platform_test.h"
#include "tool/identity_listing.h"

namespace vlm {
namespace {

using platform::LogLevel;

class DumpList : public fakes::PlatformTest {
protected:
    using Rows = std::map<std::string, std::string>;
    using Texts = std::vector<std::string>;

    bool dump(const Rows& rows, bool printedBefore) {
        return dumpList(rows, "Unpaired identities:", printedBefore, console);
    }

    std::ostringstream output;
    std::ostringstream complaints;
    Console console{output, complaints};
};

TEST_F(DumpList, OfNothingPrintsNothingAndKeepsTheFlag) {
    EXPECT_FALSE(dump({}, false));
    EXPECT_TRUE(dump({}, true));

    EXPECT_EQ(output.str(), "");
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(DumpList, PrintsTheTitleAndARowForEachKey) {
    EXPECT_TRUE(dump({{"B1", "Alice"}}, false));

    EXPECT_EQ(output.str(), "Unpaired identities:\nB1\tAlice\n");
    EXPECT_EQ(log().texts(LogLevel::Default), (Texts{"Unpaired identities:\n", "B1\tAlice\n"}));
}

TEST_F(DumpList, PrintsAnEmptyLineFirstWhenSomethingWasPrintedBefore) {
    EXPECT_TRUE(dump({{"B1", "Alice"}}, true));

    EXPECT_EQ(output.str(), "\nUnpaired identities:\nB1\tAlice\n");
    EXPECT_EQ(log().texts(LogLevel::Default).front(), "\n");
}

TEST_F(DumpList, OrdersTheRowsByTheirValues) {
    dump({{"A1", "Zoe"}, {"B2", "Alice"}, {"C3", "alice"}, {"D4", "Bob"}}, false);

    EXPECT_EQ(output.str(), "Unpaired identities:\nB2\tAlice\nD4\tBob\nA1\tZoe\nC3\talice\n");
}

TEST_F(DumpList, KeepsRowsWithEqualValuesInTheOrderOfTheirHashes) {
    dump({{"C3", "Alice"}, {"A1", "Alice"}, {"B2", "Alice"}, {"D4", "Adam"}}, false);

    EXPECT_EQ(output.str(), "Unpaired identities:\nD4\tAdam\nA1\tAlice\nB2\tAlice\nC3\tAlice\n");
}

}  // namespace
}  // namespace vlm
