#include "tool/identity_listing.h"

#include "tool_fixture.h"

namespace vlm {
namespace {

using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

class IdentityListing : public ToolTest {
protected:
    struct Listing {
        int status;
        std::string output;
    };

    Listing list() {
        std::ostringstream output;
        std::ostringstream complaints;
        Console console(output, complaints);
        const int status = listIdentities(console);
        return {status, output.str()};
    }
};

TEST_F(IdentityListing, WithoutTokenDataFailsAndPrintsNothing) {
    ipc().serve(nullptr);

    const auto listing = list();

    EXPECT_EQ(listing.status, 255);
    EXPECT_EQ(listing.output, "");
    EXPECT_TRUE(noticed("no token data found"));
}

TEST_F(IdentityListing, WithoutTokensSucceedsAndPrintsNothing) {
    const auto listing = list();

    EXPECT_EQ(listing.status, 0);
    EXPECT_EQ(listing.output, "");
}

TEST_F(IdentityListing, AsksForTheDataOfAllTokens) {
    list();

    ASSERT_EQ(ipc().exchanges.size(), 1U);
    EXPECT_FALSE(ipc().exchanges[0].request.contains("dat1"));
}

TEST_F(IdentityListing, PrintsNoEmptyLineBeforeTheOnlyGroupOfACard) {
    insertBlue();

    EXPECT_EQ(list().output,
              "SmartCard: Blue Card\n"
              "Unpaired identities:\n"
              "B1\tAlice\n"
              "B2\tAlice (mail)\n");
}

TEST_F(IdentityListing, PrintsAnEmptyLineBeforeTheSecondCard) {
    insertRed();
    insertBlue();

    EXPECT_EQ(list().output,
              "SmartCard: Blue Card\n"
              "Unpaired identities:\n"
              "B1\tAlice\n"
              "B2\tAlice (mail)\n"
              "\n"
              "SmartCard: Red Card\n"
              "Unpaired identities:\n"
              "A1\tBob\n");
}

TEST_F(IdentityListing, PrintsTheThreeGroupsWithAnEmptyLineBetweenThem) {
    service.insert({blue,
                    "Blue Card",
                    {{Bytes{1}, "Old"}, {Bytes{2}, "New"}, {Bytes{3}, "Spare"}},
                    std::nullopt});
    service.pair("alice", Bytes{1});
    service.pair("alice", Bytes{2});

    EXPECT_EQ(list().output,
              "SmartCard: Blue Card\n"
              "Paired identities which are used for authentication:\n"
              "02\talice - New\n"
              "\n"
              "Paired identities which are not used for authentication:\n"
              "01\talice - Old\n"
              "\n"
              "Unpaired identities:\n"
              "03\tSpare\n");
}

TEST_F(IdentityListing, LogsEveryLineThatItPrints) {
    insertBlue();
    insertRed();
    service.pair("bob", redSigning);

    const auto output = list().output;

    std::string logged;
    for (const auto& line : log().texts(platform::LogLevel::Default)) logged += line;
    EXPECT_EQ(logged, output);
    EXPECT_TRUE(noticed("\nSmartCard: Red Card\n"));
}

TEST_F(IdentityListing, PrintsOnlyTheNameOfACardWithNothingToList) {
    service.insert(
        {blue, "Blue Card", {{blueSigning, "Expired", /*offered=*/false}}, std::nullopt});
    insertRed();

    EXPECT_EQ(list().output,
              "SmartCard: Blue Card\n"
              "\n"
              "SmartCard: Red Card\n"
              "Unpaired identities:\n"
              "A1\tBob\n");
}

TEST_F(IdentityListing, PrintsRowsWithDifferentValuesInAscendingOrderOfValue) {
    service.insert({blue,
                    "Blue Card",
                    {{Bytes{1}, "Zoe"}, {Bytes{2}, "Bob"}, {Bytes{3}, "Alice"}, {Bytes{4}, "Bob"}},
                    std::nullopt});

    const auto output = list().output;

    EXPECT_LT(output.find("03\tAlice\n"), output.find("02\tBob\n"));
    EXPECT_LT(output.find("03\tAlice\n"), output.find("04\tBob\n"));
    EXPECT_LT(output.find("02\tBob\n"), output.find("01\tZoe\n"));
    EXPECT_LT(output.find("04\tBob\n"), output.find("01\tZoe\n"));
    EXPECT_NE(output.find("01\tZoe\n"), std::string::npos);
}

TEST_F(IdentityListing, ShowsOfSeveralAccountsWithOneHashTheLast) {
    insertRed();
    service.pair("alice", redSigning);
    service.pair("bob", redSigning);

    EXPECT_EQ(list().output,
              "SmartCard: Red Card\n"
              "Paired identities which are used for authentication:\n"
              "A1\tbob - Bob\n");
}

TEST_F(IdentityListing, TakesTheLastValueOfAKeyThatComesTwice) {
    service.tell(Dictionary{{"tnh", Array{redSigning, redSigning}},
                            {"tni", Array{red, red}},
                            {"unk", Array{redSigning, redSigning}},
                            {"unv", Array{"first", "last"}},
                            {"ftn", Dictionary{{red, "Red Card"}}}});

    EXPECT_EQ(list().output, "SmartCard: Red Card\nUnpaired identities:\nA1\tlast\n");
}

TEST_F(IdentityListing, ShowsNamesOfAnyTypeAndMarksThoseThatAreMissing) {
    service.tell(Dictionary{{"tnh", Array{Bytes{1}, Bytes{2}, Bytes{3}}},
                            {"tni", Array{red, red, red}},
                            {"hsh", Dictionary{{"alice", Bytes{1}}}},
                            {"hsk", Array{Bytes{2}}},
                            {"hsv", Array{7}},
                            {"fnh", Array{Bytes{2}}},
                            {"fni", Array{Bytes{0xAB}}},
                            {"unk", Array{Bytes{3}}},
                            {"unv", Array{true}}});

    EXPECT_EQ(list().output,
              "SmartCard: (null)\n"
              "Paired identities which are used for authentication:\n"
              "01\talice - (null)\n"
              "\n"
              "Paired identities which are not used for authentication:\n"
              "02\t7 - <AB>\n"
              "\n"
              "Unpaired identities:\n"
              "03\ttrue\n");
}

TEST_F(IdentityListing, ListsATokenThatHoldsNoHash) {
    service.tell(Dictionary{{"tni", Array{red}}, {"ftn", Dictionary{{red, "Red Card"}}}});

    EXPECT_EQ(list().output, "SmartCard: Red Card\n");
}

TEST_F(IdentityListing, LetsNoNameForgeALineOrRewriteOne) {
    service.insert({blue,
                    "Blue\nSmartCard: Forged",
                    {{Bytes{1}, "\x1B[2JAlice\t\xE2\x80\xAE"}, {Bytes{2}, "Eve\nFF\tBob"}},
                    std::nullopt});
    service.pair("ali\rce", Bytes{2});

    EXPECT_EQ(list().output,
              "SmartCard: Blue\xEF\xBF\xBDSmartCard: Forged\n"
              "Paired identities which are used for authentication:\n"
              "02\tali\xEF\xBF\xBD"
              "ce - Eve\xEF\xBF\xBD"
              "FF\xEF\xBF\xBD"
              "Bob\n"
              "\n"
              "Unpaired identities:\n"
              "01\t\xEF\xBF\xBD[2JAlice\xEF\xBF\xBD\xEF\xBF\xBD\n");
}

TEST_F(IdentityListing, ShowsAVeryLongName) {
    const std::string name(100000, 'x');
    service.insert({red, "Red Card", {{redSigning, name}}, std::nullopt});

    EXPECT_EQ(list().output, "SmartCard: Red Card\nUnpaired identities:\nA1\t" + name + "\n");
}

TEST_F(IdentityListing, ListsNothingForARecordThatIsNoneAndDoesNotMind) {
    const PropertyList records[] = {
        "text",
        7,
        Array{1, 2},
        Bytes{1},
        Dictionary{},
        Dictionary{{"tni", 1}, {"tnh", "x"}, {"hsh", Array{}}, {"ftn", 5}},
        Dictionary{{"tni", Array{1, Bytes{2}}}, {"tnh", Array{"x"}}},
    };
    for (const auto& record : records) {
        service.tell(record);
        const auto listing = list();

        EXPECT_EQ(listing.status, 0) << record.describe();
        EXPECT_EQ(listing.output, "") << record.describe();
    }
}

}  // namespace
}  // namespace vlm
