#include "services/hints/token_info.h"

#include <gtest/gtest.h>

#include "cards.h"

namespace vlm::service {
namespace {

using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;

Pairing pairing(const std::string& account, std::uint8_t key, std::int64_t sequence) {
    return {account, hashOf(key), sequence, kNow};
}

PropertyList recordFor(const std::vector<Token>& tokens, const std::vector<Pairing>& pairings,
                       TokenInfoRequest request = {}) {
    PairingsByHash byHash;
    for (const auto& each : pairings) byHash[each.hash].push_back(each);
    request.now = kNow;
    return tokenInfo(tokens, byHash, request);
}

const PropertyList& entry(const PropertyList& record, const char* key) {
    static const PropertyList kMissing("the key is missing");
    const auto* found = record.dictionary()->find(key);
    return found ? *found : kMissing;
}

TEST(TokenInfoTest, HoldsEveryKeyAlsoWithoutACard) {
    const auto record = recordFor({}, {});

    for (const auto* key : {"tnh", "tni", "unk", "unv", "hsk", "hsv", "uth", "uti", "fnh", "fni"})
        EXPECT_EQ(entry(record, key), PropertyList(Array{})) << key;
    for (const auto* key : {"hsh", "ftn"})
        EXPECT_EQ(entry(record, key), PropertyList(Dictionary{})) << key;
}

TEST(TokenInfoTest, TellsTheTokenAndTheNameOfEveryIdentity) {
    auto first = tokenOf("pkcs11:token=a", "Card A", {identityOf(1, "Alice"), identityOf(2, "Al")});
    first.wrapKeyHash = hashOf(9);
    const auto second = tokenOf("pkcs11:token=b", "Card B", {identityOf(3, "Bob")});

    const auto record = recordFor({first, second}, {});

    EXPECT_EQ(entry(record, "tnh"), PropertyList(Array{hashOf(1), hashOf(2), hashOf(3)}));
    EXPECT_EQ(entry(record, "tni"),
              PropertyList(Array{"pkcs11:token=a", "pkcs11:token=a", "pkcs11:token=b"}));
    EXPECT_EQ(entry(record, "fnh"), entry(record, "tnh"));
    EXPECT_EQ(entry(record, "fni"), PropertyList(Array{"Alice", "Al", "Bob"}));
    EXPECT_EQ(entry(record, "uth"), PropertyList(Array{hashOf(9)}));
    EXPECT_EQ(entry(record, "uti"), PropertyList(Array{"pkcs11:token=a"}));
    EXPECT_EQ(entry(record, "ftn"),
              PropertyList(Dictionary{{"pkcs11:token=a", "Card A"}, {"pkcs11:token=b", "Card B"}}));
}

TEST(TokenInfoTest, OffersAnIdentityThatIsNotPairedByItsName) {
    const auto record = recordFor({tokenOf("a", "A", {identityOf(1, "Alice")})}, {});

    EXPECT_EQ(entry(record, "unk"), PropertyList(Array{hashOf(1)}));
    EXPECT_EQ(entry(record, "unv"), PropertyList(Array{"Alice"}));
}

struct NotOffered {
    const char* why;
    void (*change)(Identity&);
};

TEST(TokenInfoTest, OffersOnlyWhatLoginWouldAccept) {
    const NotOffered rules[] = {
        {"expired", [](Identity& identity) { identity.notAfter = kNow - 1; }},
        {"not valid yet", [](Identity& identity) { identity.notBefore = kNow + 1; }},
        {"not for signing", [](Identity& identity) { identity.canSign = false; }},
    };
    for (const auto& [why, change] : rules) {
        SCOPED_TRACE(why);
        auto identity = identityOf(1, "Alice");
        change(identity);

        const auto record = recordFor({tokenOf("a", "A", {identity})}, {});
        const auto paired = recordFor({tokenOf("a", "A", {identity})}, {pairing("alice", 1, 1)});

        EXPECT_EQ(entry(record, "unk"), PropertyList(Array{}));
        EXPECT_EQ(entry(record, "tnh"), PropertyList(Array{hashOf(1)}));
        EXPECT_EQ(entry(paired, "hsh"), PropertyList(Dictionary{}));
        EXPECT_EQ(entry(paired, "hsk"), PropertyList(Array{hashOf(1)}));
        EXPECT_EQ(entry(paired, "hsv"), PropertyList(Array{"alice"}));
    }
}

TEST(TokenInfoTest, UsesNoDistrustedIdentityForAuthenticationAndOffersItAllTheSame) {
    auto identity = identityOf(1, "Alice");
    identity.distrust = "it has been revoked";

    const auto record = recordFor({tokenOf("a", "A", {identity})}, {});
    const auto paired = recordFor({tokenOf("a", "A", {identity})}, {pairing("alice", 1, 1)});

    EXPECT_EQ(entry(record, "unk"), PropertyList(Array{hashOf(1)}));
    EXPECT_EQ(entry(paired, "hsh"), PropertyList(Dictionary{}));
    EXPECT_EQ(entry(paired, "hsk"), PropertyList(Array{hashOf(1)}));
}

TEST(TokenInfoTest, OffersNothingThatIsPairedWithAnyAccount) {
    const auto record = recordFor({tokenOf("a", "A", {identityOf(1, "Alice")})},
                                  {pairing("bob", 1, 1)}, {.onlyAccount = "alice"});

    EXPECT_EQ(entry(record, "unk"), PropertyList(Array{}));
}

TEST(TokenInfoTest, UsesTheLatestPairingOfAnAccountForAuthentication) {
    const std::vector<Token> tokens{
        tokenOf("a", "A", {identityOf(1, "Old"), identityOf(2, "New")})};

    const auto record = recordFor(tokens, {pairing("alice", 1, 1), pairing("alice", 2, 2)});

    EXPECT_EQ(entry(record, "hsh"), PropertyList(Dictionary{{"alice", hashOf(2)}}));
    EXPECT_EQ(entry(record, "hsk"), PropertyList(Array{hashOf(1), hashOf(2)}));
    EXPECT_EQ(entry(record, "hsv"), PropertyList(Array{"alice", "alice"}));
}

TEST(TokenInfoTest, FallsBackToAnEarlierPairingWhenTheLatestHasExpired) {
    auto expired = identityOf(2, "New");
    expired.notAfter = kNow - 1;
    const std::vector<Token> tokens{tokenOf("a", "A", {identityOf(1, "Old"), expired})};

    const auto record = recordFor(tokens, {pairing("alice", 1, 1), pairing("alice", 2, 2)});

    EXPECT_EQ(entry(record, "hsh"), PropertyList(Dictionary{{"alice", hashOf(1)}}));
}

TEST(TokenInfoTest, NamesTheAccountsThatDoNotLogInWithAKeyBesideThoseThatDo) {
    // bob logs in with key 1; alice and carol have a later one.
    const std::vector<Token> tokens{tokenOf("a", "A", {identityOf(1, "x"), identityOf(2, "y")})};

    const auto record =
        recordFor(tokens, {pairing("carol", 1, 1), pairing("alice", 1, 2), pairing("bob", 1, 3),
                           pairing("alice", 2, 4), pairing("carol", 2, 5)});

    EXPECT_EQ(entry(record, "hsv"), PropertyList(Array{"alice, carol", "alice, carol"}));
    EXPECT_EQ(
        entry(record, "hsh"),
        PropertyList(Dictionary{{"alice", hashOf(2)}, {"bob", hashOf(1)}, {"carol", hashOf(2)}}));
}

TEST(TokenInfoTest, CoversOneTokenAndStillKnowsTheOthers) {
    const std::vector<Token> tokens{tokenOf("a", "A", {identityOf(1, "x")}),
                                    tokenOf("b", "B", {identityOf(2, "y")})};

    const auto record =
        recordFor(tokens, {pairing("alice", 1, 1), pairing("alice", 2, 2)}, {.onlyToken = "a"});

    EXPECT_EQ(entry(record, "tnh"), PropertyList(Array{hashOf(1)}));
    EXPECT_EQ(entry(record, "ftn"), PropertyList(Dictionary{{"a", "A"}}));
    EXPECT_EQ(entry(record, "hsk"), PropertyList(Array{hashOf(1)}));
    // Her login is by the key on the other token.
    EXPECT_EQ(entry(record, "hsh"), PropertyList(Dictionary{}));
}

TEST(TokenInfoTest, IsEmptyForATokenThatIsNotInserted) {
    const auto record =
        recordFor({tokenOf("a", "A", {identityOf(1, "x")})}, {}, {.onlyToken = "b"});

    EXPECT_EQ(entry(record, "tnh"), PropertyList(Array{}));
    EXPECT_EQ(entry(record, "ftn"), PropertyList(Dictionary{}));
}

TEST(TokenInfoTest, TellsNoNameOfAnotherAccount) {
    const std::vector<Token> tokens{
        tokenOf("a", "A", {identityOf(1, "x"), identityOf(2, "y"), identityOf(3, "z")})};

    const auto record =
        recordFor(tokens,
                  {pairing("bob", 1, 1), pairing("carol", 1, 2), pairing("alice", 2, 3),
                   pairing("bob", 2, 4), pairing("alice", 3, 5)},
                  {.onlyAccount = "alice"});

    EXPECT_EQ(entry(record, "hsv"),
              PropertyList(Array{"another account", "alice, another account", "alice"}));
    EXPECT_EQ(entry(record, "hsh"), PropertyList(Dictionary{{"alice", hashOf(3)}}));
}

TEST(TokenInfoTest, ShowsTheSameKeyOnTwoTokensOnBoth) {
    const std::vector<Token> tokens{tokenOf("a", "A", {identityOf(1, "x")}),
                                    tokenOf("b", "B", {identityOf(1, "x")})};

    const auto record = recordFor(tokens, {});

    EXPECT_EQ(entry(record, "tnh"), PropertyList(Array{hashOf(1), hashOf(1)}));
    EXPECT_EQ(entry(record, "tni"), PropertyList(Array{"a", "b"}));
}

}  // namespace
}  // namespace vlm::service
