#include "tool_fixture.h"

namespace vlm {
namespace {

using platform::Error;

class PairCommand : public ToolTest {
protected:
    void SetUp() override {
        ToolTest::SetUp();
        runAsRoot();
        accounts().add("alice", 1000);
        sessions().login(1000, /*onConsole=*/true);
        insertBlue();
    }

    Run pair(const Texts& more = {}) {
        Texts arguments{"-p", "-u", "alice", "-h", "B1"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return vlmbind(arguments);
    }
    static Texts warningWith(const std::string& why) {
        return {"Failed to store Login keychain unlock key. " + why,
                "User was successfully paired (public key hash: B1) but user password will be "
                "required after next SmartCard login to unlock Login keychain."};
    }
};

TEST_F(PairCommand, PairsTheUserAndPrintsNothing) {
    const auto run = pair();

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
    EXPECT_EQ(service.pairings,
              (std::vector<std::pair<std::string, Bytes>>{{"alice", blueSigning}}));
    EXPECT_EQ(debugLines().back(), "exiting");
}

TEST_F(PairCommand, SaysThatThePairingSucceededWhenVerbose) {
    const auto run = pair({"-v"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, {"User was successfully paired (public key hash: B1)."});
}

TEST_F(PairCommand, LogsWhomItPairsWithTheHashInItsDefaultTextForm) {
    pair();

    EXPECT_TRUE(debugged("pairing user alice with pubkey hash: <B1>)"));
}

TEST_F(PairCommand, RequiresNoWrapKey) {
    pair();

    EXPECT_TRUE(noticed("updateTokenCache for token: (null) (requireWrapKey: 0)"));
}

TEST_F(PairCommand, StoresTheUnlockKeyForTheSameHash) {
    pair();

    ASSERT_EQ(keychain().stored.size(), 1U);
    EXPECT_EQ(keychain().stored[0].hash, blueSigning);
}

TEST_F(PairCommand, PrintsAWarningAndStillSucceedsWhenTheUnlockKeyIsNotStored) {
    localization().translate("NO_WRAP_KEY_ERROR", "This card cannot do it.");
    service.remove(blue);
    service.insert({red, "Red Card", {{blueSigning, "Alice"}}, std::nullopt});
    const Texts warning = warningWith("This card cannot do it.");

    const auto run = pair();
    EXPECT_EQ(run.status, 0);
    expectPrinted(run, warning);
    EXPECT_EQ(debugLines().back(), "exiting");

    service.pairings.clear();
    const auto verbose = pair({"-v"});
    EXPECT_EQ(verbose.status, 0);
    expectPrinted(verbose, warning);
}

TEST_F(PairCommand, SaysThatAnUnlockKeyIsStoredAtTheConsoleOnly) {
    localization().translate("STORE_UNLOCK_KEY_CURRENT_USER_ERROR", "Alice is not here.");
    accounts().add("bob", 1001);

    const auto run = vlmbind({"-p", "-u", "bob", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, warningWith("Alice is not here."));
}

TEST_F(PairCommand, SaysInWordsWhyTheKeychainDidNotStore) {
    struct Case {
        platform::Status status;
        std::string words;
    };
    for (const auto& [status, words] :
         {Case{-2004, "was pulled out"}, Case{-2007, "was not entered"},
          Case{-2021, "There is no login keyring"}, Case{-2022, "does not open the login keyring"},
          Case{-2023, "has no key that can protect"},
          Case{-2013, "The operation could not be completed. (VLErrorDomain error -2013)"}}) {
        keychain().failWith(status);
        service.pairings.clear();

        const auto run = pair();

        EXPECT_EQ(run.status, 0);
        EXPECT_NE(run.output.find("Failed to store Login keychain unlock key. "),
                  std::string::npos);
        EXPECT_NE(run.output.find(words), std::string::npos) << run.output;
        EXPECT_EQ(service.pairings.size(), 1U) << "the pairing stands";
    }
}

TEST_F(PairCommand, IsRefusedByTheOneCardRuleForAUserWhoIsPaired) {
    fakes::settings().values["oneCardPerUser"] = 1;
    service.pair("alice", redSigning);

    const auto run = pair();

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user who is already paired"});
    EXPECT_EQ(service.requests.size(), 1U) << "only whether the user is paired was asked";
    EXPECT_EQ(service.requests[Service::kIsUserBound], 1);
}

TEST_F(PairCommand, PairsUnderTheOneCardRuleAUserWhoIsNotPaired) {
    fakes::settings().values["oneCardPerUser"] = 5;

    EXPECT_EQ(pair().status, 0);
    EXPECT_EQ(service.requests[Service::kIsUserBound], 1);
}

TEST_F(PairCommand, DoesNotAskWhetherTheUserIsPairedWithoutTheOneCardRule) {
    service.pair("alice", redSigning);

    EXPECT_EQ(pair().status, 0);
    EXPECT_EQ(fakes::settings().asked, Texts{"oneCardPerUser"});
    EXPECT_EQ(service.requests[Service::kIsUserBound], 0);
}

TEST_F(PairCommand, TakesAUserForPairedWhenThatCannotBeFoundOut) {
    fakes::settings().values["oneCardPerUser"] = 1;
    ipc().serve(nullptr);

    expectPrinted(pair(), {"Cannot pair user who is already paired"});
}

TEST_F(PairCommand, SaysWhyThePairingFailed) {
    service.failWith(Service::kPerformLogin, -2008,
                     Error{"VLErrorDomain", -2008, "The PIN is wrong, 2 tries left."});

    const auto run = pair();

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user (public key hash: B1). The PIN is wrong, 2 tries left."});
    EXPECT_TRUE(keychain().asked.empty());
    EXPECT_FALSE(debugged("exiting"));
}

TEST_F(PairCommand, SaysThatTheCardIsPairedAlready) {
    localization().translate("SC_IS_ALREADY_PAIRED", "This card is paired already.");
    service.pair("bob", blueMail);

    const auto run = pair();

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user (public key hash: B1). This card is paired already."});
}

TEST_F(PairCommand, GivesTheNumberOfAFailureWithoutWords) {
    service.failWith(Service::kPerformLogin, -2010);

    expectPrinted(pair(), {"Cannot pair user (public key hash: B1). The operation could not be "
                           "completed. (VLErrorDomain error -2010)"});
}

TEST_F(PairCommand, LetsNoErrorTextForgeALine) {
    service.failWith(Service::kPerformLogin, -2010, Error{"VLErrorDomain", -2010, "bad\ncard"});

    expectPrinted(pair(), {"Cannot pair user (public key hash: B1). bad\xEF\xBF\xBD"
                           "card"});
}

TEST_F(PairCommand, FailsForAHashThatNoCardHolds) {
    const auto run = vlmbind({"-p", "-u", "alice", "-h", "A1"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user (public key hash: A1). The operation could not be "
                        "completed. (VLErrorDomain error -8)"});
}

TEST_F(PairCommand, DoesNotRequireAHashAndFailsWithoutOne) {
    const auto run = vlmbind({"-p", "-u", "alice"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user (public key hash: (null)). The operation could not be "
                        "completed. (VLErrorDomain error -8)"});
    EXPECT_TRUE(debugged("pairing user alice with pubkey hash: (null))"));
}

TEST_F(PairCommand, PassesOnThatNoUserWasGiven) {
    fakes::settings().values["oneCardPerUser"] = 1;

    const auto run = vlmbind({"-p", "-h", "B1"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot pair user (public key hash: B1). The operation could not be "
                        "completed. (VLErrorDomain error -1001)"});
    EXPECT_TRUE(debugged("pairing user (null) with pubkey hash: <B1>)"));
    EXPECT_TRUE(service.pairings.empty());
}

}  // namespace
}  // namespace vlm
