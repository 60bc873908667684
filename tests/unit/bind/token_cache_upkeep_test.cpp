#include "bind_operation_fixture.h"

namespace vlm {
namespace {

class WrapKeyForTokenId : public BindOperationTest {};

TEST_F(WrapKeyForTokenId, IsTheHashRecordedForTheToken) {
    operation->setWrapKeysHashMap(WrapKeys{{redWrap, red}, {blueWrap, blue}});

    EXPECT_EQ(operation->wrapKeyForTokenId(blue), blueWrap);
    EXPECT_TRUE(debugged("wrap pub key hash found for token: pkcs11:token=blue"));
}

TEST_F(WrapKeyForTokenId, IsNoneAndLogsNothingForAnotherToken) {
    operation->setWrapKeysHashMap(WrapKeys{{redWrap, red}});

    EXPECT_EQ(operation->wrapKeyForTokenId(blue), std::nullopt);
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(WrapKeyForTokenId, IsNoneWithoutACache) {
    EXPECT_EQ(operation->wrapKeyForTokenId(blue), std::nullopt);
    EXPECT_TRUE(log().lines().empty());
}

class TokenInserted : public BindOperationTest {};

TEST_F(TokenInserted, SendsNoRequestForATokenThatIsCachedAlready) {
    operation->setUnpairedIdentities(Identities{{blue, {{blueSigning, "Alice"}}}});

    operation->tokenInserted(blue);

    EXPECT_EQ(askedForTokens(), 0);
}

TEST_F(TokenInserted, AddsWhatTheTokenOffersAndRequiresAWrapKey) {
    insertRed();
    operation->_updateTokenCache(std::nullopt, true);
    insertBlue();

    operation->tokenInserted(blue);

    EXPECT_TRUE(offered()->contains(blue));
    EXPECT_TRUE(offered()->contains(red));
    EXPECT_TRUE(noticed("updateTokenCache for token: pkcs11:token=blue (requireWrapKey: 1)"));
}

TEST_F(TokenInserted, MakesTheCacheWhenThereIsNone) {
    insertBlue();

    operation->tokenInserted(blue);

    EXPECT_TRUE(offered()->contains(blue));
}

TEST_F(TokenInserted, OffersNothingFromATokenWithoutAWrapKey) {
    insertRedWithoutWrapKey();

    operation->tokenInserted(red);

    EXPECT_EQ(offered(), Identities{});
}

class TokenRemoved : public BindOperationTest {};

TEST_F(TokenRemoved, TakesBackWhatTheTokenOfferedAndItsWrapKeys) {
    operation->setUnpairedIdentities(
        Identities{{blue, {{blueSigning, "Alice"}}}, {red, {{redSigning, "Bob"}}}});
    operation->setWrapKeysHashMap(WrapKeys{{blueWrap, blue}, {Bytes{0xBC}, blue}, {redWrap, red}});

    operation->tokenRemoved(blue);

    EXPECT_EQ(offered(), (Identities{{red, {{redSigning, "Bob"}}}}));
    EXPECT_EQ(wrapKeys(), (WrapKeys{{redWrap, red}}));
}

TEST_F(TokenRemoved, OfTheLastOneLeavesAnEmptyCacheAndNotNone) {
    operation->setUnpairedIdentities(Identities{{blue, {{blueSigning, "Alice"}}}});
    operation->setWrapKeysHashMap(WrapKeys{{blueWrap, blue}});

    operation->tokenRemoved(blue);

    EXPECT_EQ(offered(), Identities{});
    EXPECT_EQ(wrapKeys(), WrapKeys{});
}

TEST_F(TokenRemoved, LeavesAbsentWrapKeysAbsent) {
    operation->setUnpairedIdentities(Identities{{blue, {{blueSigning, "Alice"}}}});

    operation->tokenRemoved(blue);

    EXPECT_EQ(offered(), Identities{});
    EXPECT_EQ(wrapKeys(), std::nullopt);
}

TEST_F(TokenRemoved, LeavesTheWrapKeysOfATokenThatWasNeverOffered) {
    operation->setUnpairedIdentities(Identities{{red, {{redSigning, "Bob"}}}});
    operation->setWrapKeysHashMap(WrapKeys{{blueWrap, blue}, {redWrap, red}});

    operation->tokenRemoved(blue);

    EXPECT_EQ(offered(), (Identities{{red, {{redSigning, "Bob"}}}}));
    EXPECT_EQ(wrapKeys(), (WrapKeys{{blueWrap, blue}, {redWrap, red}}));
}

TEST_F(TokenRemoved, DoesNothingWithoutACache) {
    operation->setWrapKeysHashMap(WrapKeys{{blueWrap, blue}});

    operation->tokenRemoved(blue);

    EXPECT_EQ(offered(), std::nullopt);
    EXPECT_EQ(wrapKeys(), (WrapKeys{{blueWrap, blue}}));
    EXPECT_EQ(askedForTokens(), 0);
}

}  // namespace
}  // namespace vlm
