#include "bind_operation_fixture.h"

namespace vlm {
namespace {

using platform::Error;
using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

class PairUser : public BindOperationTest {
protected:
    void SetUp() override {
        BindOperationTest::SetUp();
        localization().translate("SC_IS_ALREADY_PAIRED", "This card is paired already.");
    }

    int loginsAsked() { return service.requests[Service::kPerformLogin]; }
    int bindsAsked() { return service.requests[Service::kBindUser]; }

    const Error pinWrong{"VLErrorDomain", -2008, "The PIN is wrong, 2 tries left."};
    std::optional<Error> error;
};

TEST_F(PairUser, LogsInToTheCardAndBindsTheUser) {
    insertBlue();

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), 0);

    EXPECT_EQ(error, std::nullopt);
    const std::vector<std::pair<std::string, Bytes>> expected{{"alice", blueSigning}};
    EXPECT_EQ(service.pairings, expected);
    EXPECT_TRUE(debugged("VLPerformLogin: 0, error: (null)"));
    EXPECT_TRUE(debugged("VLBindUser: 0"));
    EXPECT_TRUE(noticed("pairUser = 0, error: (null) (user = alice, pubkey hash: B1)"));
}

TEST_F(PairUser, AsksForTheLoginWithTheTokenAndTheHashAndNoOtherStrings) {
    sessions().login(1000, /*onConsole=*/true);
    insertBlue();

    operation->pairUser(blueMail, true, &error);

    ASSERT_EQ(ipc().exchanges.size(), 3U);
    const auto& login = ipc().exchanges[1].request;
    EXPECT_EQ(login.unsignedInteger("op"), 0U);
    EXPECT_EQ(*login.text("str1"), blue);
    EXPECT_EQ(*login.bytes("dat1"), blueMail);
    EXPECT_FALSE(login.contains("str2"));
    EXPECT_FALSE(login.contains("str3"));
    EXPECT_EQ(login.integer("uid"), 1000);
    const auto& bind = ipc().exchanges[2].request;
    EXPECT_EQ(bind.unsignedInteger("op"), 2U);
    EXPECT_EQ(*bind.text("str1"), "alice");
    EXPECT_EQ(*bind.bytes("dat1"), blueMail);
}

TEST_F(PairUser, FillsAnAbsentCacheOnceAndInFullBeforeItPairs) {
    insertBlue();
    insertRedWithoutWrapKey();

    EXPECT_EQ(operation->pairUser(redSigning, /*requireWrapKey=*/false, &error), 0);

    EXPECT_EQ(askedForTokens(), 1);
    EXPECT_TRUE(noticed("updateTokenCache for token: (null) (requireWrapKey: 0)"));
    EXPECT_EQ(offered()->size(), 2U);
}

TEST_F(PairUser, HandsOnWhetherAWrapKeyIsRequired) {
    insertRedWithoutWrapKey();

    EXPECT_EQ(operation->pairUser(redSigning, /*requireWrapKey=*/true, nullptr), -8);

    EXPECT_TRUE(noticed("updateTokenCache for token: (null) (requireWrapKey: 1)"));
}

TEST_F(PairUser, SendsNoTokenInfoRequestWithACachePresent) {
    insertBlue();
    operation->setUnpairedIdentities(Identities{{blue, {{blueSigning, "Alice"}}}});

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), 0);

    EXPECT_EQ(askedForTokens(), 0);
}

TEST_F(PairUser, TakesAnEmptyCacheForACache) {
    insertBlue();
    operation->setUnpairedIdentities(Identities{});

    EXPECT_EQ(operation->pairUser(blueSigning, true, nullptr), -8);

    EXPECT_EQ(askedForTokens(), 0);
}

TEST_F(PairUser, RefusesAHashOfACardThatIsPairedThroughAnyOtherOfItsKeys) {
    insertBlue();
    service.pair("bob", blueMail);

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -8);

    EXPECT_EQ(error, (Error{"VLErrorDomain", -8, "This card is paired already."}));
    EXPECT_EQ(loginsAsked(), 0);
    EXPECT_EQ(bindsAsked(), 0);
    EXPECT_TRUE(noticed("cannot find unpaired public key hash: B1"));
}

TEST_F(PairUser, RefusesAHashThatNoInsertedCardHoldsWithoutADescription) {
    insertBlue();

    EXPECT_EQ(operation->pairUser(redSigning, true, &error), -8);

    EXPECT_EQ(error, (Error{"VLErrorDomain", -8, std::nullopt}));
    EXPECT_TRUE(debugged("found unpaired token: (null) for pubKeyHash: A1"));
    EXPECT_TRUE(noticed("cannot find unpaired public key hash: A1"));
    EXPECT_EQ(loginsAsked(), 0);
}

TEST_F(PairUser, RefusesNoHashAtAllWithoutADescription) {
    insertBlue();

    EXPECT_EQ(operation->pairUser(std::nullopt, true, &error), -8);

    EXPECT_EQ(error, (Error{"VLErrorDomain", -8, std::nullopt}));
    EXPECT_TRUE(noticed("cannot find unpaired public key hash: (null)"));
}

TEST_F(PairUser, RefusesTheHashOfACardThatWasPulledAfterItWasListed) {
    insertBlue();
    insertRed();
    operation->_updateTokenCache(std::nullopt, true);
    service.remove(blue);
    operation->tokenRemoved(blue);

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -8);

    EXPECT_EQ(error, (Error{"VLErrorDomain", -8, std::nullopt}));
    EXPECT_EQ(loginsAsked(), 0);
}

TEST_F(PairUser, AsksWhyOnlyForACallerWhoWantsToKnow) {
    insertBlue();
    service.pair("bob", blueMail);

    EXPECT_EQ(operation->pairUser(blueSigning, true, nullptr), -8);

    EXPECT_EQ(askedForTokens(), 1) << "for the cache only";
}

TEST_F(PairUser, ReturnsTheLoginsFailureAndNeverBinds) {
    insertBlue();
    service.failWith(Service::kPerformLogin, -2008, pinWrong);

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -2008);

    EXPECT_EQ(error, pinWrong);
    EXPECT_EQ(bindsAsked(), 0);
    EXPECT_TRUE(
        debugged("VLPerformLogin: -2008, error: VLErrorDomain error -2008: The PIN is "
                 "wrong, 2 tries left."));
    EXPECT_TRUE(
        noticed("pairUser = -2008, error: VLErrorDomain error -2008: The PIN is wrong, 2 "
                "tries left. (user = alice, pubkey hash: B1)"));
}

TEST_F(PairUser, ReturnsTheBindsFailure) {
    insertBlue();
    const Error notPermitted{"VLErrorDomain", -2001, "Only root may pair."};
    service.failWith(Service::kBindUser, -2001, notPermitted);

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -2001);

    EXPECT_EQ(error, notPermitted);
    EXPECT_TRUE(debugged("VLBindUser: -2001"));
}

TEST_F(PairUser, DropsTheServicesErrorWithoutAPlaceForIt) {
    insertBlue();
    service.failWith(Service::kPerformLogin, -2008, pinWrong);

    EXPECT_EQ(operation->pairUser(blueSigning, true, nullptr), -2008);

    EXPECT_TRUE(noticed("pairUser = -2008, error: (null) (user = alice, pubkey hash: B1)"));
}

TEST_F(PairUser, LeavesTheCallersPlaceAloneWhenTheServiceGaveNoError) {
    insertBlue();
    service.failWith(Service::kPerformLogin, -2010);

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -2010);

    EXPECT_EQ(error, std::nullopt);
}

TEST_F(PairUser, WithoutAUserIsRefusedByTheBindAlone) {
    operation->setUserName(std::nullopt);
    insertBlue();

    EXPECT_EQ(operation->pairUser(blueSigning, true, &error), -1001);

    EXPECT_EQ(bindsAsked(), 0);
    EXPECT_TRUE(noticed("pairUser = -1001, error: (null) (user = (null), pubkey hash: B1)"));
}

TEST_F(PairUser, LeavesTheCacheAsItWasOnSuccessAndOnFailure) {
    insertBlue();
    operation->_updateTokenCache(std::nullopt, true);
    const auto before = offered();

    operation->pairUser(blueSigning, true, &error);
    EXPECT_EQ(offered(), before);

    service.failWith(Service::kPerformLogin, -2008, pinWrong);
    operation->pairUser(blueSigning, true, &error);
    EXPECT_EQ(offered(), before);
}

class TokenIdForUnpairedPubKeyHash : public BindOperationTest {};

TEST_F(TokenIdForUnpairedPubKeyHash, IsTheTokenThatOffersTheHash) {
    operation->setUnpairedIdentities(
        Identities{{blue, {{blueSigning, "Alice"}}}, {red, {{redSigning, "Bob"}}}});

    EXPECT_EQ(operation->tokenIdForUnpairedPubKeyHash(redSigning), red);
    EXPECT_TRUE(debugged("found unpaired token: pkcs11:token=red for pubKeyHash: A1"));
}

TEST_F(TokenIdForUnpairedPubKeyHash, IsNoneForAHashThatIsNotOffered) {
    operation->setUnpairedIdentities(Identities{{blue, {{blueSigning, "Alice"}}}});

    EXPECT_EQ(operation->tokenIdForUnpairedPubKeyHash(blueMail), std::nullopt);
    EXPECT_TRUE(debugged("found unpaired token: (null) for pubKeyHash: B2"));
}

TEST_F(TokenIdForUnpairedPubKeyHash, IsNoneWithoutACacheAndWithoutAHash) {
    EXPECT_EQ(operation->tokenIdForUnpairedPubKeyHash(blueMail), std::nullopt);
    EXPECT_EQ(operation->tokenIdForUnpairedPubKeyHash(std::nullopt), std::nullopt);
    EXPECT_TRUE(debugged("found unpaired token: (null) for pubKeyHash: (null)"));
}

class IsSmartCardPaired : public BindOperationTest {
protected:
    const Dictionary cards{{"tnh", Array{blueSigning, blueMail, redSigning}},
                           {"tni", Array{blue, blue, red}}};

    bool paired(const std::string& key, const PropertyList& value, const Bytes& hash) {
        Dictionary record = cards;
        record.set(key, value);
        service.tell(record);
        return operation->_isSmartCardPaired(hash);
    }
};

TEST_F(IsSmartCardPaired, ByTheHashItselfOrAnyOtherOfTheSameCard) {
    EXPECT_TRUE(paired("hsk", Array{blueSigning}, blueSigning));
    EXPECT_TRUE(paired("hsk", Array{blueMail}, blueSigning));
    EXPECT_FALSE(paired("hsk", Array{redSigning}, blueSigning)) << "another card's hash";
}

TEST_F(IsSmartCardPaired, ByAHashThatIsUsedForAuthentication) {
    EXPECT_TRUE(paired("hsh", Dictionary{{"bob", blueMail}}, blueSigning));
    EXPECT_FALSE(paired("hsh", Dictionary{{"bob", redSigning}}, blueSigning));
}

TEST_F(IsSmartCardPaired, IsFalseWhenNothingIsBound) {
    service.tell(cards);

    EXPECT_FALSE(operation->_isSmartCardPaired(blueSigning));
}

TEST_F(IsSmartCardPaired, IsFalseForAHashThatNoCardHolds) {
    EXPECT_FALSE(paired("hsk", Array{Bytes{0x99}}, Bytes{0x99}));
    EXPECT_FALSE(operation->_isSmartCardPaired(std::nullopt));
}

TEST_F(IsSmartCardPaired, IsFalseWithoutTokenData) {
    service.script(Service::kCopyAvailableTokensInfo, platform::Message());

    EXPECT_FALSE(operation->_isSmartCardPaired(blueSigning));
    EXPECT_TRUE(debugged("no token data found"));
}

}  // namespace
}  // namespace vlm
