#include "control_fixture.h"

namespace vlm::control {
namespace {

using testing::HasSubstr;
using Array = platform::PropertyList::Array;
using Dictionary = platform::PropertyList::Dictionary;

class TokensCommand : public ControlTest {
protected:
    const Bytes first{0xB1};
    const Bytes second{0xB2};
};

TEST_F(TokensCommand, ListsWhatIsUsedThenWhatIsPairedThenTheRest) {
    service.insert(
        {"pkcs11:token=blue",
         "Blue Card",
         {{{0xB1}, "Expired", false}, {{0xB2}, "Spare"}, {{0xB3}, "Old"}, {{0xB4}, "New"}},
         {}});
    service.pair("alice", {0xB3});
    service.pair("alice", {0xB4});

    const auto run = vlmctl({"tokens"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output,
              "CARD       IDENTITY  STATE           ACCOUNT  PUBLIC KEY HASH  TOKEN\n"
              "Blue Card  New       used for login  alice    B4               pkcs11:token=blue\n"
              "Blue Card  Old       paired          alice    B3               pkcs11:token=blue\n"
              "Blue Card  Spare     unpaired        -        B2               pkcs11:token=blue\n"
              "Blue Card  Expired   not usable      -        B1               pkcs11:token=blue\n");
}

TEST_F(TokensCommand, OrdersCardsByTheirIdentifiersAsTheListingOfTheTool) {
    service.insert({"pkcs11:token=b", "B", {{first, "Bob"}}, {}});
    service.insert({"pkcs11:token=a", "A", {{second, "Alice"}}, {}});

    EXPECT_EQ(vlmctl({"tokens", "--no-legend"}).output,
              "A  Alice  unpaired  -  B2  pkcs11:token=a\n"
              "B  Bob    unpaired  -  B1  pkcs11:token=b\n");
}

TEST_F(TokensCommand, ShowsACardThatHoldsNothing) {
    service.insert({"pkcs11:token=a", "Empty", {}, {}});

    EXPECT_EQ(vlmctl({"tokens", "--no-legend"}).output,
              "Empty  -  no identities  -  -  pkcs11:token=a\n");
}

TEST_F(TokensCommand, NamesTheOthersOfASharedKeyAfterThoseWhoLogInWithIt) {
    service.tell(Dictionary{{"tnh", Array{first}},
                            {"tni", Array{"pkcs11:token=a"}},
                            {"hsk", Array{first}},
                            {"hsv", Array{"another account"}},
                            {"hsh", Dictionary{{"alice", first}, {"bob", first}}},
                            {"fnh", Array{first}},
                            {"fni", Array{"Shared"}},
                            {"ftn", Dictionary{{"pkcs11:token=a", "A"}}}});

    EXPECT_THAT(vlmctl({"tokens"}).output, HasSubstr("  alice, bob, another account  B1"));
}

TEST_F(TokensCommand, WithoutCardsSucceeds) {
    EXPECT_EQ(vlmctl({"tokens"}).output, "No cards.\n");
    EXPECT_EQ(vlmctl({"tokens", "--no-legend"}).output, "");
    EXPECT_EQ(vlmctl({"tokens", "--json"}).output, "{\n  \"tokens\": []\n}\n");
    EXPECT_EQ(vlmctl({"tokens"}).status, 0);
}

TEST_F(TokensCommand, SaysThatTheServiceIsNotThere) {
    ipc().serve(nullptr);

    const auto run = vlmctl({"tokens"});

    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.output, "");
    EXPECT_THAT(run.complaints, testing::StartsWith("vlmctl: the hints service gave no answer"));
}

TEST_F(TokensCommand, LetsNoCardForgeARow) {
    service.insert({"pkcs11:token=a", "Card\n", {{first, "Eve\nroot \x1b[2J"}}, {}});

    const auto lines = vlmctl({"tokens"}).output;

    EXPECT_EQ(std::count(lines.begin(), lines.end(), '\n'), 2);
    EXPECT_EQ(lines.find('\x1b'), std::string::npos);
}

TEST_F(TokensCommand, WritesJson) {
    service.insert({"pkcs11:token=a", "A", {{first, "Al\n"}, {second, "Spare"}}, {}});
    service.pair("alice", first);

    EXPECT_EQ(vlmctl({"tokens", "--json"}).output, R"({
  "tokens": [
    {
      "token": "pkcs11:token=a",
      "name": "A",
      "identities": [
        {
          "hash": "B1",
          "name": "Al\n",
          "state": "used",
          "accounts": "alice"
        },
        {
          "hash": "B2",
          "name": "Spare",
          "state": "unpaired",
          "accounts": null
        }
      ]
    }
  ]
}
)");
}

}  // namespace
}  // namespace vlm::control
