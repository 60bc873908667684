#include "bind_operation_fixture.h"

namespace vlm {
namespace {

using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

class TokenCacheTest : public BindOperationTest {
protected:
    const Identities bothBlue{{blue, {{blueSigning, "Alice"}, {blueMail, "Alice (mail)"}}}};
    const Identities onlyRed{{red, {{redSigning, "Bob"}}}};
};

TEST_F(TokenCacheTest, HoldsWhatAllCardsOffer) {
    insertBlue();
    insertRed();

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), (Identities{{blue, {{blueSigning, "Alice"}, {blueMail, "Alice (mail)"}}},
                                     {red, {{redSigning, "Bob"}}}}));
    EXPECT_EQ(wrapKeys(), (WrapKeys{{blueWrap, blue}, {redWrap, red}}));
    EXPECT_TRUE(noticed("updateTokenCache for token: (null) (requireWrapKey: 1)"));
}

TEST_F(TokenCacheTest, SaysWhatItFoundAndWhatItHolds) {
    insertRed();
    operation->_updateTokenCache(std::nullopt, true);
    insertBlue();

    operation->_updateTokenCache(blue, false);

    EXPECT_TRUE(noticed("updateTokenCache for token: pkcs11:token=blue (requireWrapKey: 0)"));
    EXPECT_TRUE(
        debugged("unpaired identities: {\"pkcs11:token=red\": {\"A1\": \"Bob\"}} for "
                 "token: (null)"));
    EXPECT_TRUE(
        debugged("unpaired identities: {\"pkcs11:token=blue\": {\"B1\": \"Alice\", "
                 "\"B2\": \"Alice (mail)\"}} for token: pkcs11:token=blue"));
    EXPECT_TRUE(
        debugged("all unmatched identities: {\"pkcs11:token=blue\": {\"B1\": \"Alice\", "
                 "\"B2\": \"Alice (mail)\"}, \"pkcs11:token=red\": {\"A1\": \"Bob\"}}"));
}

TEST_F(TokenCacheTest, OffersNothingFromACardThatHasOneHashBoundAndAnotherNotBound) {
    insertBlue();
    insertRed();
    service.pair("alice", blueMail);

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), onlyRed);
}

TEST_F(TokenCacheTest, CountsACardAsPairedByEitherOfTheMapsOfBoundHashes) {
    const Dictionary card{{"tnh", Array{blueSigning, redSigning}}, {"tni", Array{blue, red}},
                          {"unk", Array{blueSigning, redSigning}}, {"unv", Array{"Alice", "Bob"}},
                          {"uth", Array{blueWrap, redWrap}},       {"uti", Array{blue, red}}};
    auto byAccount = card;
    byAccount.set("hsh", Dictionary{{"alice", blueSigning}});
    auto byHash = card;
    byHash.set("hsk", Array{blueSigning});
    byHash.set("hsv", Array{"alice"});

    for (const auto& record : {byAccount, byHash}) {
        service.tell(record);
        operation->_updateTokenCache(std::nullopt, true);
        EXPECT_EQ(offered(), onlyRed);
    }
}

TEST_F(TokenCacheTest, CaresForNoBoundHashThatIsOnNoCard) {
    insertRed();
    service.pair("alice", blueSigning);

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), onlyRed);
}

TEST_F(TokenCacheTest, OffersNothingFromACardOfWhichNoHashCanBePaired) {
    service.insert({blue, "Blue Card", {{blueSigning, "Alice", /*offered=*/false}}, blueWrap});

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), Identities{}) << "the cache is there, and empty";
}

TEST_F(TokenCacheTest, LeavesOutTheHashesThatCannotBePaired) {
    service.insert({blue,
                    "Blue Card",
                    {{blueSigning, "Alice"}, {blueMail, "Expired", /*offered=*/false}},
                    blueWrap});

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), (Identities{{blue, {{blueSigning, "Alice"}}}}));
}

TEST_F(TokenCacheTest, LeavesOutACardWithoutAWrapKeyWhenOneIsRequired) {
    insertBlue();
    insertRedWithoutWrapKey();

    operation->_updateTokenCache(std::nullopt, /*requireWrapKey=*/true);

    EXPECT_EQ(offered(), bothBlue);
    EXPECT_TRUE(noticed("No RSA decryption key or ECDH key was found for token: pkcs11:token=red"));
}

TEST_F(TokenCacheTest, StillOffersACardWithoutAWrapKeyWhenNoneIsRequiredAndLogsThatThereIsNone) {
    insertRedWithoutWrapKey();

    operation->_updateTokenCache(std::nullopt, /*requireWrapKey=*/false);

    EXPECT_EQ(offered(), onlyRed);
    EXPECT_TRUE(noticed("No RSA decryption key or ECDH key was found for token: pkcs11:token=red"));
}

TEST_F(TokenCacheTest, AFullRebuildLeavesBothMapsAbsentWhenEveryCardIsPaired) {
    insertBlue();
    operation->_updateTokenCache(std::nullopt, true);
    service.pair("alice", blueSigning);

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), std::nullopt);
    EXPECT_EQ(wrapKeys(), std::nullopt);
    EXPECT_TRUE(debugged("cannot find any unmatched identities for user: alice"));
}

TEST_F(TokenCacheTest, AFullRebuildForgetsWhatIsGone) {
    insertBlue();
    insertRed();
    operation->_updateTokenCache(std::nullopt, true);
    service.remove(blue);

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), onlyRed);
    EXPECT_EQ(wrapKeys(), (WrapKeys{{redWrap, red}}));
}

TEST_F(TokenCacheTest, AFullRebuildWithoutDataLeavesBothMapsAbsent) {
    insertBlue();
    operation->_updateTokenCache(std::nullopt, true);
    service.script(Service::kCopyAvailableTokensInfo, platform::Message());

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), std::nullopt);
    EXPECT_EQ(wrapKeys(), std::nullopt);
    EXPECT_TRUE(debugged("no token data found"));
}

TEST_F(TokenCacheTest, ARecordWithoutTokensLeavesBothMapsAbsent) {
    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), std::nullopt);
    EXPECT_TRUE(debugged("cannot find any unmatched identities for user: alice"));
}

TEST_F(TokenCacheTest, ARecordThatIsNoDictionaryOffersNothing) {
    service.tell(Array{1, 2, 3});

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(offered(), std::nullopt);
}

TEST_F(TokenCacheTest, AnAnswerWithoutContextOrWithABrokenOneLeavesTheCacheAsItWas) {
    insertBlue();
    operation->_updateTokenCache(std::nullopt, true);
    const PropertyList answers[] = {Dictionary{{"other", 1}}, Dictionary{{"ctx", Bytes{1, 2}}}};

    for (const auto& answer : answers) {
        service.script(Service::kCopyAvailableTokensInfo, Service::propertyList(answer));
        operation->_updateTokenCache(red, true);

        EXPECT_EQ(offered(), bothBlue) << answer.describe();
        EXPECT_EQ(wrapKeys(), (WrapKeys{{blueWrap, blue}}));
    }
}

TEST_F(TokenCacheTest, NewEntriesReplaceThoseOfTheSameTokenAndTheSameWrapKey) {
    operation->setUnpairedIdentities(Identities{{red, {{blueMail, "old"}}}, {"kept", {}}});
    operation->setWrapKeysHashMap(WrapKeys{{redWrap, "old"}, {Bytes{0xCC}, "kept"}});
    insertRed();

    operation->_updateTokenCache(red, true);

    EXPECT_EQ(offered(), (Identities{{red, {{redSigning, "Bob"}}}, {"kept", {}}}));
    EXPECT_EQ(wrapKeys(), (WrapKeys{{redWrap, red}, {Bytes{0xCC}, "kept"}}));
}

TEST_F(TokenCacheTest, TheWrapKeysStayUntouchedWhenNoCardCanBePaired) {
    operation->setWrapKeysHashMap(WrapKeys{{redWrap, red}});
    insertBlue();
    service.pair("alice", blueSigning);

    operation->_updateTokenCache(blue, true);

    EXPECT_EQ(wrapKeys(), (WrapKeys{{redWrap, red}}));
}

TEST_F(TokenCacheTest, AReaderKeepsTheMapThatItGotThroughARebuild) {
    insertBlue();
    operation->_updateTokenCache(std::nullopt, true);
    const auto before = operation->unpairedIdentities();
    service.remove(blue);

    operation->_updateTokenCache(std::nullopt, true);

    EXPECT_EQ(*before, bothBlue);
    EXPECT_EQ(offered(), std::nullopt);
}

}  // namespace
}  // namespace vlm
