// The main job from the shell, all of it real: tool, bus, service, card module, database.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "machine.h"

namespace vlm::test {

using ::testing::HasSubstr;
using ::testing::StartsWith;

namespace {

constexpr const char* kWarning =
    "Failed to store Login keychain unlock key. The key that unlocks the login keyring can be "
    "stored only for the user who is logged in at this computer.\n";

class MainJob : public ::testing::Test {
protected:
    void SetUp() override {
        if (getuid() != 0) GTEST_SKIP() << "the bus lets only root run the service";
    }

    // The first hash in a listing.
    std::string firstHash(const std::string& listing) {
        const auto tab = listing.find('\t');
        return tab == std::string::npos || tab < 64 ? "" : listing.substr(tab - 64, 64);
    }

    Machine machine;
};

TEST_F(MainJob, ListsPairsListsAndUnpairs) {
    machine.cards.add("Card", {identity("rsa2048", "Alice Example")});
    machine.startService();

    const auto before = machine.vlmbind({"-i"});
    const std::string hash = firstHash(before.output);
    EXPECT_EQ(before.output,
              "SmartCard: Card\nUnpaired identities:\n" + hash + "\tAlice Example\n");
    EXPECT_EQ(before.status, 0);

    const auto paired = machine.vlmbind({"-p", "-u", "root", "-h", hash});
    EXPECT_EQ(paired.output, kWarning + ("User was successfully paired (public key hash: " + hash) +
                                 ") but user password will be required after next SmartCard login "
                                 "to unlock Login keychain.\n");
    EXPECT_EQ(paired.status, 0) << paired.errors << machine.serviceLog();

    const auto listed = machine.vlmbind({"-i"});
    EXPECT_EQ(listed.output,
              "SmartCard: Card\nPaired identities which are used for authentication:\n" + hash +
                  "\troot - Alice Example\n");

    const auto unpaired = machine.vlmbind({"-r", "-v", "-u", "root", "-h", hash});
    EXPECT_EQ(unpaired.output, "User was successfully unpaired (public key hash: " + hash + ").\n");
    EXPECT_EQ(unpaired.status, 0);

    EXPECT_EQ(machine.vlmbind({"-i"}).output, before.output);
}

TEST_F(MainJob, WorksWithAnEllipticCurveIdentity) {
    machine.cards.add("Card", {identity("p256", "Alice Example")});
    machine.startService();
    const std::string hash = firstHash(machine.vlmbind({"-i"}).output);

    const auto paired = machine.vlmbind({"-p", "-u", "root", "-h", hash});

    EXPECT_EQ(paired.status, 0) << paired.output;
    EXPECT_THAT(machine.vlmbind({"-i"}).output, HasSubstr(hash + "\troot - Alice Example\n"));
}

TEST_F(MainJob, APairingIsStillThereWhenTheServiceStartsAgain) {
    machine.cards.add("Card", {identity("p256", "Alice Example")});
    machine.startService();
    const auto hash = firstHash(machine.vlmbind({"-i"}).output);
    ASSERT_EQ(machine.vlmbind({"-p", "-u", "root", "-h", hash}).status, 0);

    machine.stopService();
    machine.startService();

    EXPECT_THAT(machine.vlmbind({"-i"}).output, HasSubstr("root - Alice Example"));
}

TEST_F(MainJob, EachCardIsListedUnderItsNameInTheOrderOfTheirIdentifiers) {
    machine.cards.add("Second", {identity("p256", "Bob")});
    machine.cards.add("First", {identity("p256", "Alice")});
    machine.startService();

    const auto listing = machine.vlmbind({"-i"});

    EXPECT_EQ(listing.status, 0);
    EXPECT_THAT(listing.output, StartsWith("SmartCard: "));
    EXPECT_THAT(listing.output, HasSubstr("\n\nSmartCard: "));
    EXPECT_THAT(listing.output, HasSubstr("\tAlice\n"));
    EXPECT_THAT(listing.output, HasSubstr("\tBob\n"));
}

TEST_F(MainJob, ACardThatComesAndGoesIsListedWhileItIsIn) {
    machine.startService();
    EXPECT_EQ(machine.vlmbind({"-i"}).output, "");

    machine.cards.add("Card", {identity("p256", "Alice")});
    EXPECT_THAT(machine.listingOnceItShows("Alice"), HasSubstr("Alice"));

    machine.cards.remove("Card");
    EXPECT_EQ(machine.listingOnceItShows(""), "");
}

TEST_F(MainJob, ANameFromACardCannotForgeALine) {
    machine.cards.add("Card", {identity("p256", "Eve\n00\troot - \x1b[2JAlice")});
    machine.startService();

    const auto listing = machine.vlmbind({"-i"}).output;

    EXPECT_EQ(std::count(listing.begin(), listing.end(), '\n'), 3) << listing;
    EXPECT_EQ(std::count(listing.begin(), listing.end(), '\t'), 1) << listing;
    EXPECT_EQ(listing.find('\x1b'), std::string::npos);
}

}  // namespace

}  // namespace vlm::test
