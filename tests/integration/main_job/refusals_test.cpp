// What goes wrong from the shell, and what a person is told.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "machine.h"

namespace vlm::test {

using ::testing::HasSubstr;
using ::testing::StartsWith;

namespace {

constexpr int kAborted = 128 + 6;

class Refusals : public ::testing::Test {
protected:
    std::string onlyHash() {
        const auto listing = machine.vlmbind({"-i"}).output;
        const auto tab = listing.find('\t');
        return tab == std::string::npos ? "" : listing.substr(tab - 64, 64);
    }

    Machine machine;
};

class PairingRefusals : public Refusals {
protected:
    void SetUp() override {
        if (getuid() != 0) GTEST_SKIP() << "pairing needs root";
    }
};

TEST_F(Refusals, WithoutTheServiceNothingIsListed) {
    const auto listing = machine.vlmbind({"-i"});

    EXPECT_EQ(listing.status, 255);
    EXPECT_EQ(listing.output, "");
}

TEST_F(Refusals, WithoutTheServiceUnpairingSaysWhatIsMissing) {
    const auto refused = machine.vlmbind({"-r", "-u", "root", "-h", "AB"});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, StartsWith("Cannot unpair user (public key hash: AB). "));
    EXPECT_THAT(refused.output, HasSubstr("org.vlm.token.hints.daemon"));
}

TEST_F(Refusals, WithoutAHomeFolderTheToolEndsBeforeItDoesAnything) {
    const auto ended = machine.vlmbind({"-i"}, std::nullopt, {{"HOME", std::nullopt}});

    EXPECT_EQ(ended.status, kAborted);
    EXPECT_EQ(ended.output, "");
}

TEST_F(Refusals, AWordThatIsNoOptionIsRefusedInSilence) {
    const auto ended = machine.vlmbind({"status"});

    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.output, "");
}

TEST_F(Refusals, AListingThatDoesNotFitOnTheDiskIsAFailure) {
    if (getuid() != 0) GTEST_SKIP() << "the bus lets only root run the service";
    machine.cards.add("Card", {identity("p256", "Alice")});
    machine.startService();

    const auto ended = machine.run({"sh", "-c", "exec \"$0\" -i > /dev/full", machine.tool()});

    EXPECT_EQ(ended.status, 255) << ended.errors;
    EXPECT_THAT(ended.errors, HasSubstr("Cannot write to standard output."));
}

TEST_F(PairingRefusals, AWrongPinPairsNothingAndNamesTheCard) {
    machine.cards.add("Demo card", {identity("rsa2048", "Alice")});
    machine.startService("999999");
    const auto hash = onlyHash();

    const auto refused = machine.vlmbind({"-p", "-u", "root", "-h", hash});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, StartsWith("Cannot pair user (public key hash: " + hash + "). "));
    EXPECT_THAT(refused.output, HasSubstr("Demo card"));
    EXPECT_THAT(refused.output, HasSubstr("refused the PIN"));
    EXPECT_THAT(machine.vlmbind({"-i"}).output, HasSubstr("Unpaired identities:"));
}

TEST_F(PairingRefusals, ThePinIsInNoLog) {
    machine.cards.add("Card", {identity("p256", "Alice")});
    machine.startService();

    ASSERT_EQ(machine.vlmbind({"-p", "-u", "root", "-h", onlyHash()}).status, 0);
    machine.stopService();

    EXPECT_EQ(machine.serviceLog().find(SoftCards::kPin), std::string::npos);
}

TEST_F(PairingRefusals, ACardThatIsPairedIsNotPairedAgain) {
    machine.cards.add("Card", {identity("p256", "Alice")});
    machine.startService();
    const auto hash = onlyHash();
    ASSERT_EQ(machine.vlmbind({"-p", "-u", "root", "-h", hash}).status, 0);

    const auto refused = machine.vlmbind({"-p", "-u", "nobody", "-h", hash});

    EXPECT_EQ(refused.status, 255);
    EXPECT_EQ(refused.output, "Cannot pair user (public key hash: " + hash +
                                  "). This smart card is already paired with an account.\n");
}

TEST_F(PairingRefusals, AKeyThatNoCardHoldsIsRefused) {
    machine.cards.add("Card", {identity("p256", "Alice")});
    machine.startService();

    const auto refused = machine.vlmbind({"-p", "-u", "root", "-h", "00FF"});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, StartsWith("Cannot pair user (public key hash: 00FF). "));
}

TEST_F(PairingRefusals, AnAccountThatDoesNotExistIsRefused) {
    machine.cards.add("Card", {identity("p256", "Alice")});
    machine.startService();

    const auto refused = machine.vlmbind({"-p", "-u", "no-such-account", "-h", onlyHash()});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, HasSubstr("no such account"));
}

TEST_F(PairingRefusals, AnExpiredIdentityIsNotOffered) {
    auto expired = identity("p256", "Alice");
    expired.certificates.front().fromDay = -20;
    expired.certificates.front().untilDay = -10;
    machine.cards.add("Card", {expired});
    machine.startService();

    EXPECT_EQ(machine.vlmbind({"-i"}).output, "SmartCard: Card\n");
}

TEST_F(PairingRefusals, UnpairingWhatIsNotPairedSaysSo) {
    machine.startService();

    const auto refused = machine.vlmbind({"-r", "-u", "root", "-h", std::string(64, 'A')});

    EXPECT_EQ(refused.status, 255);
    EXPECT_THAT(refused.output, HasSubstr("not paired"));
}

}  // namespace

}  // namespace vlm::test
