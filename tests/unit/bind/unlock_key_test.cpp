#include "bind_operation_fixture.h"

namespace vlm {
namespace {

using platform::Error;

// Alice sits at the machine and was paired with the blue card.
class StoreUnlockKey : public BindOperationTest {
protected:
    void SetUp() override {
        BindOperationTest::SetUp();
        accounts().add("alice", 1000);
        accounts().add("bob", 1001);
        localization().translate("STORE_UNLOCK_KEY_CURRENT_USER_ERROR", "Only at the console.");
        localization().translate("NO_WRAP_KEY_ERROR", "No key to wrap with.");
    }

    void aliceSitsHere() { sessions().login(1000, /*onConsole=*/true); }
    void cache(const WrapKeys& wrapKeys) {
        operation->setUnpairedIdentities(
            Identities{{blue, {{blueSigning, "Alice"}}}, {red, {{redSigning, "Bob"}}}});
        operation->setWrapKeysHashMap(wrapKeys);
    }
    void aliceIsPairedWithBlue() {
        aliceSitsHere();
        cache({{blueWrap, blue}, {redWrap, red}});
    }

    bool keychainTouched() { return keychain().copies > 0 || !keychain().asked.empty(); }
    static Error refusal(const std::optional<std::string>& why) {
        return {"VLErrorDomain", -8, why};
    }

    std::optional<Error> error;
};

TEST_F(StoreUnlockKey, AsksTheKeychainWithTheHashItsTokenAndThatTokensWrapKey) {
    aliceIsPairedWithBlue();

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), 0);

    EXPECT_EQ(keychain().asked, (std::vector<fakes::FakeKeychain::Stored>{
                                    {blueSigning, blue, blueWrap, "/keyring/login", ""}}));
    EXPECT_EQ(error, std::nullopt);
}

TEST_F(StoreUnlockKey, LogsEachStatusAndTheOutcome) {
    aliceIsPairedWithBlue();

    operation->storeUnlockKey(blueSigning, &error);

    EXPECT_TRUE(debugged("copyLoginKeychain: 0"));
    EXPECT_TRUE(debugged("keychain storeUnlockKey: 0"));
    EXPECT_TRUE(debugged("storeUnlockKeyWithPubKeyHash: 0"));
    EXPECT_EQ(log().texts(platform::LogLevel::Default),
              (std::vector<std::string>{
                  "storeUnlockKey = 0, error: (null) (user = alice, pubkey hash: B1)"}));
}

TEST_F(StoreUnlockKey, AlwaysStoresAnEmptyText) {
    aliceIsPairedWithBlue();

    operation->storeUnlockKey(blueSigning, nullptr);

    ASSERT_EQ(keychain().asked.size(), 1U);
    EXPECT_EQ(keychain().asked[0].text, "");
}

TEST_F(StoreUnlockKey, NeverCallsTheKeychainForAUserWhoIsNotAtTheConsole) {
    sessions().login(1000, /*onConsole=*/false);
    sessions().login(1001, /*onConsole=*/true);
    cache({{blueWrap, blue}});

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_EQ(error, refusal("Only at the console."));
    EXPECT_FALSE(keychainTouched());
    EXPECT_TRUE(log().texts(platform::LogLevel::Default).empty());
    EXPECT_FALSE(debugged("found unpaired token: pkcs11:token=blue for pubKeyHash: B1"))
        << "it is refused before any look-up";
}

TEST_F(StoreUnlockKey, RefusesWhereNobodyIsAtTheConsole) {
    cache({{blueWrap, blue}});

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_EQ(error, refusal("Only at the console."));
    EXPECT_FALSE(keychainTouched());
}

TEST_F(StoreUnlockKey, RefusesAnOperationWithoutAUserAlsoWhereNobodyIsAtTheConsole) {
    operation->setUserName(std::nullopt);
    cache({{blueWrap, blue}});

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_EQ(error, refusal("Only at the console."));
    EXPECT_FALSE(keychainTouched());
}

TEST_F(StoreUnlockKey, ComparesTheNamesOfUsersByTheirLetters) {
    aliceIsPairedWithBlue();
    operation->setUserName("Alice");

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_FALSE(keychainTouched());
}

TEST_F(StoreUnlockKey, RefusesAHashThatNoCachedIdentityHoldsWithoutADescription) {
    aliceIsPairedWithBlue();

    EXPECT_EQ(operation->storeUnlockKey(blueMail, &error), -8);

    EXPECT_EQ(error, refusal(std::nullopt));
    EXPECT_FALSE(keychainTouched());
    EXPECT_EQ(log().texts(platform::LogLevel::Default),
              (std::vector<std::string>{"cannot find unpaired public key hash: <B2>"}));
}

TEST_F(StoreUnlockKey, RefusesNoHashAtAll) {
    aliceIsPairedWithBlue();

    EXPECT_EQ(operation->storeUnlockKey(std::nullopt, &error), -8);

    EXPECT_EQ(error, refusal(std::nullopt));
    EXPECT_TRUE(noticed("cannot find unpaired public key hash: (null)"));
}

TEST_F(StoreUnlockKey, DoesNotFillACacheThatIsAbsent) {
    aliceSitsHere();
    insertBlue();

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_EQ(service.requests[Service::kCopyAvailableTokensInfo], 0);
}

TEST_F(StoreUnlockKey, RefusesACardWithoutAWrapKey) {
    aliceSitsHere();
    cache({{redWrap, red}});

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -8);

    EXPECT_EQ(error, refusal("No key to wrap with."));
    EXPECT_FALSE(keychainTouched());
    EXPECT_TRUE(log().texts(platform::LogLevel::Default).empty()) << "nothing is logged";
}

TEST_F(StoreUnlockKey, NeedsNoPlaceForAnErrorForAnyRefusal) {
    cache({{redWrap, red}});
    EXPECT_EQ(operation->storeUnlockKey(blueSigning, nullptr), -8);
    aliceSitsHere();
    EXPECT_EQ(operation->storeUnlockKey(blueMail, nullptr), -8);
    EXPECT_EQ(operation->storeUnlockKey(blueSigning, nullptr), -8);
    EXPECT_FALSE(keychainTouched());
}

TEST_F(StoreUnlockKey, ReturnsTheStatusOfAKeyringThatCannotBeCopiedAndStoresNothing) {
    aliceIsPairedWithBlue();
    keychain().failToCopyWith(-2021);

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -2021);

    EXPECT_EQ(error, std::nullopt) << "a keychain's failure makes no error object";
    EXPECT_TRUE(keychain().asked.empty());
    EXPECT_TRUE(debugged("copyLoginKeychain: -2021"));
    EXPECT_TRUE(debugged("storeUnlockKeyWithPubKeyHash: -2021"));
    EXPECT_TRUE(noticed("storeUnlockKey = -2021, error: (null) (user = alice, pubkey hash: B1)"));
}

TEST_F(StoreUnlockKey, ReturnsTheStatusOfAKeychainThatDoesNotStore) {
    aliceIsPairedWithBlue();
    keychain().failWith(-2022);

    EXPECT_EQ(operation->storeUnlockKey(blueSigning, &error), -2022);

    EXPECT_EQ(error, std::nullopt);
    EXPECT_TRUE(debugged("keychain storeUnlockKey: -2022"));
    EXPECT_TRUE(debugged("storeUnlockKeyWithPubKeyHash: -2022"));
    EXPECT_TRUE(noticed("storeUnlockKey = -2022, error: (null) (user = alice, pubkey hash: B1)"));
}

TEST_F(StoreUnlockKey, ReleasesTheKeyringWhateverBecomesOfTheStoring) {
    aliceIsPairedWithBlue();

    operation->storeUnlockKey(blueSigning, &error);
    EXPECT_EQ(keychain().held(), 0);

    keychain().failWith(-2022);
    operation->storeUnlockKey(blueSigning, &error);
    EXPECT_EQ(keychain().held(), 0);
    EXPECT_EQ(keychain().copies, 2);
}

TEST_F(StoreUnlockKey, LogsWhatTheCallersPlaceHolds) {
    aliceIsPairedWithBlue();
    error = Error{"VLErrorDomain", -1, "from before"};

    operation->storeUnlockKey(blueSigning, &error);

    EXPECT_EQ(error, (Error{"VLErrorDomain", -1, "from before"}));
    EXPECT_TRUE(
        noticed("storeUnlockKey = 0, error: VLErrorDomain error -1: from before (user = alice, "
                "pubkey hash: B1)"));
}

}  // namespace
}  // namespace vlm
