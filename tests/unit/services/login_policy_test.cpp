#include "services/hints/login_policy.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>

#include "cards.h"
#include "fake_pairing_store.h"
#include "platform/property_list.h"
#include "platform_test.h"
#include "services/hints/status.h"
#include "settings/known_settings.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

constexpr const char* kNoFile = "/dev/null/none";

class LoginPolicyTest : public fakes::PlatformTest {
protected:
    LoginPolicyTest() {
        accounts().add("alice", 1000);
        accounts().add("bob", 1001);
    }

    void set(const std::string& key, platform::PropertyList value) {
        preferences().put(key, std::string(kSmartcardDomain), platform::PreferencesUser::Any,
                          std::move(value));
    }
    void pair(const std::string& account, std::uint8_t key) {
        pairings.pair(account, hashOf(key), kNow);
    }
    static Token card(const std::string& name, std::vector<Identity> identities) {
        return tokenOf("pkcs11:token=" + name, name, std::move(identities));
    }
    static Identity expired(std::uint8_t key) {
        auto identity = identityOf(key, "Old");
        identity.notAfter = kNow - 1;
        return identity;
    }

    static std::string chosen(const Outcome<LoginCard>& card) {
        if (!card) return "refused " + std::to_string(card.refusal().status);
        return card->account + " " + card->token.name + " " + card->identity.name;
    }
    std::string cardOf(const std::string& account, const std::vector<Token>& inserted) {
        return chosen(policy.cardOf(account, inserted));
    }
    std::string cardOfAnybody(const std::vector<Token>& inserted) {
        return chosen(policy.cardOfAnybody(inserted));
    }

    fakes::FakePairingStore pairings;
    std::int64_t now = kNow;
    LoginPolicy policy{{pairings, [this] { return now; }, kNoFile}};
};

TEST_F(LoginPolicyTest, ChoosesTheCardThatIsPairedWithTheAccount) {
    pair("alice", 1);
    pair("bob", 2);

    EXPECT_EQ(cardOf("alice", {card("a", {identityOf(1, "A"), identityOf(2, "B")})}), "alice a A");
    EXPECT_EQ(cardOf("bob", {card("a", {identityOf(1, "A"), identityOf(2, "B")})}), "bob a B");
}

TEST_F(LoginPolicyTest, PrefersTheLatestPairingOnWhateverCard) {
    pair("alice", 2);
    pair("alice", 1);
    const std::vector<Token> inserted{card("a", {identityOf(2, "Old")}),
                                      card("b", {identityOf(1, "New")})};

    EXPECT_EQ(cardOf("alice", inserted), "alice b New");
    pair("alice", 2);
    EXPECT_EQ(cardOf("alice", inserted), "alice a Old");
}

TEST_F(LoginPolicyTest, PassesOverALatestPairingThatIsNotAccepted) {
    pair("alice", 2);
    pair("alice", 1);

    EXPECT_EQ(cardOf("alice", {card("a", {expired(1), identityOf(2, "Good")})}), "alice a Good");
}

TEST_F(LoginPolicyTest, SaysWhyTheOnlyCardIsNotAccepted) {
    pair("alice", 1);

    const auto old = policy.cardOf("alice", {card("a", {expired(1)})});
    EXPECT_EQ(chosen(old), "refused -2020");
    EXPECT_THAT(old.refusal().text, HasSubstr("\"Old\" is not good for a login: it has expired"));

    now = kNow - 11;
    const auto early = policy.cardOf("alice", {card("a", {identityOf(1, "A")})});
    EXPECT_EQ(chosen(early), "refused -2020");
    EXPECT_THAT(early.refusal().text, HasSubstr("not yet valid"));

    now = kNow;
    auto locked = card("a", {identityOf(1, "A")});
    locked.pinState = PinState::Locked;
    EXPECT_EQ(cardOf("alice", {locked}), "refused -2009");
}

TEST_F(LoginPolicyTest, TakesNoCertificateThatTheMachineDistrusts) {
    pair("alice", 1);
    auto revoked = identityOf(1, "A");
    revoked.distrust = "it was revoked";

    const auto card = policy.cardOf("alice", {this->card("a", {revoked})});
    EXPECT_EQ(chosen(card), "refused -2020");
    EXPECT_THAT(card.refusal().text, HasSubstr("it was revoked"));
    EXPECT_EQ(cardOfAnybody({this->card("a", {revoked})}), "refused -2018");
}

TEST_F(LoginPolicyTest, TakesACertificateFromItsFirstToItsLastSecond) {
    pair("alice", 1);
    const std::vector<Token> inserted{card("a", {identityOf(1, "A")})};
    struct Row {
        std::int64_t now;
        const char* answer;
    };
    for (const auto& [second, answer] :
         {Row{kNow - 11, "refused -2020"}, Row{kNow - 10, "alice a A"}, Row{kNow + 10, "alice a A"},
          Row{kNow + 11, "refused -2020"}}) {
        now = second;
        EXPECT_EQ(cardOf("alice", inserted), answer) << second;
    }
}

TEST_F(LoginPolicyTest, TakesNoCardThatCannotProveAnything) {
    pair("alice", 1);
    auto noSignature = identityOf(1, "A");
    noSignature.canSign = false;
    auto noPin = card("b", {identityOf(1, "A")});
    noPin.needsLogin = false;

    EXPECT_EQ(cardOf("alice", {card("a", {noSignature})}), "refused -2018");
    EXPECT_EQ(cardOf("alice", {noPin}), "refused -2018") << "whoever finds it would be let in";
    EXPECT_EQ(cardOfAnybody({noPin}), "refused -2018");
}

TEST_F(LoginPolicyTest, TellsNobodyWhoHasAnAccountOrAPairing) {
    pair("alice", 1);
    pair("ghost", 2);
    const std::vector<Token> inserted{card("a", {identityOf(2, "Left behind")})};

    auto unknown = policy.cardOf("nobody-here", inserted).refusal();
    EXPECT_EQ(unknown.status, status::kNoLoginCard);
    for (const std::string account : {"alice", "bob", "ghost"}) {
        auto refusal = policy.cardOf(account, inserted).refusal();
        EXPECT_EQ(refusal.status, unknown.status) << account;
        refusal.text.replace(refusal.text.find(account), account.size(), "nobody-here");
        EXPECT_EQ(refusal.text, unknown.text);
    }
}

TEST_F(LoginPolicyTest, FindsTheAccountHoweverAPersonSpellsIt) {
    accounts().add("ALICE", 1000);
    accounts().add("alice", 1000);
    pair("alice", 1);

    EXPECT_EQ(cardOf("ALICE", {card("a", {identityOf(1, "A")})}), "alice a A");
}

TEST_F(LoginPolicyTest, NamesTheOneAccountOfTheInsertedCards) {
    pair("alice", 1);
    const auto first = card("a", {identityOf(1, "A")});
    const auto second = card("b", {identityOf(2, "B"), identityOf(3, "C")});

    EXPECT_EQ(cardOfAnybody({}), "refused -2018");
    EXPECT_EQ(cardOfAnybody({second}), "refused -2018");
    EXPECT_EQ(cardOfAnybody({first, second}), "alice a A");
    pair("alice", 3);
    EXPECT_EQ(cardOfAnybody({first, second}), "alice b C");
    pair("bob", 2);
    EXPECT_EQ(cardOfAnybody({first, second}), "refused -2018");
}

TEST_F(LoginPolicyTest, NamesNobodyWhereTwoAccountsShareAKey) {
    pair("alice", 1);
    pair("bob", 1);
    const std::vector<Token> inserted{card("a", {identityOf(1, "A")})};

    EXPECT_EQ(cardOfAnybody(inserted), "refused -2018");
    EXPECT_EQ(cardOf("alice", inserted), "alice a A");
    EXPECT_EQ(cardOf("bob", inserted), "bob a A");
}

TEST_F(LoginPolicyTest, NamesNoAccountThatIsGoneOrWhoseCardIsNotAccepted) {
    pair("ghost", 1);
    pair("bob", 3);
    pair("alice", 2);

    EXPECT_EQ(cardOfAnybody({card("a", {identityOf(1, "A"), identityOf(2, "B"), expired(3)})}),
              "alice a B");
    EXPECT_EQ(cardOfAnybody({card("a", {expired(3)})}), "refused -2018");
}

TEST_F(LoginPolicyTest, KnowsRootAsAnyOtherAccount) {
    accounts().add("root", 0);
    pair("root", 1);
    const std::vector<Token> inserted{card("a", {identityOf(1, "A")})};

    EXPECT_EQ(cardOf("root", inserted), "root a A");
    EXPECT_EQ(cardOfAnybody(inserted), "root a A");
    set("enforceSmartCard", 1);
    EXPECT_EQ(cardOf("root", {}), "refused -2019");
}

TEST_F(LoginPolicyTest, TakesNoCardWhereTheMachineAllowsNone) {
    pair("alice", 1);
    set("allowSmartCard", 0);
    const std::vector<Token> inserted{card("a", {identityOf(1, "A")})};

    EXPECT_EQ(cardOf("alice", inserted), "refused -2018");
    EXPECT_EQ(cardOfAnybody(inserted), "refused -2018");
    EXPECT_EQ(chosen(policy.thisCard("alice", "pkcs11:token=a", hashOf(1), inserted)),
              "refused -2018");
    set("enforceSmartCard", 1);
    EXPECT_EQ(cardOf("alice", inserted), "refused -2019");
}

TEST_F(LoginPolicyTest, AsksForACardWhereNobodyGetsInWithoutOne) {
    pair("alice", 1);
    set("enforceSmartCard", 1);

    EXPECT_EQ(cardOf("alice", {}), "refused -2019");
    EXPECT_EQ(cardOf("bob", {}), "refused -2019");
    EXPECT_EQ(cardOf("nobody-here", {}), "refused -2019");
    EXPECT_EQ(cardOfAnybody({}), "refused -2019");
    EXPECT_EQ(cardOf("alice", {card("a", {identityOf(1, "A")})}), "alice a A");
}

TEST_F(LoginPolicyTest, AsksOnlyPairedAccountsForACardWhereOthersAreAllowed) {
    pair("alice", 1);
    set("enforceSmartCard", 1);
    set("allowUnmappedUsers", 1);

    EXPECT_EQ(cardOf("alice", {}), "refused -2019");
    EXPECT_EQ(cardOf("bob", {}), "refused -2018");
    EXPECT_EQ(cardOf("nobody-here", {}), "refused -2018");
    EXPECT_EQ(cardOfAnybody({}), "refused -2018");
}

TEST_F(LoginPolicyTest, AsksEverybodyForACardWhereAttributesAreMapped) {
    std::string pattern = std::filesystem::temp_directory_path() / "vlm-login-XXXXXX";
    ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
    const std::filesystem::path file = std::filesystem::path(pattern) / "SmartcardLogin.plist";
    const platform::PropertyList list =
        platform::PropertyList::Dictionary{{"AttributeMapping", true}};
    const auto bytes = *platform::writeBinaryPropertyList(list);
    std::ofstream(file, std::ios::binary) << std::string(bytes.begin(), bytes.end());
    set("enforceSmartCard", 1);
    set("allowUnmappedUsers", 1);

    const LoginPolicy mapped{{pairings, [this] { return now; }, file}};

    EXPECT_TRUE(mapped.requiresCard("bob"));
    EXPECT_FALSE(policy.requiresCard("bob"));
    std::filesystem::remove_all(pattern);
}

TEST_F(LoginPolicyTest, LetsNobodyPastARuleThatItCannotReadThePairingsFor) {
    set("enforceSmartCard", 1);
    set("allowUnmappedUsers", 1);
    pairings.breakDown("the disk is gone");

    EXPECT_TRUE(policy.requiresCard("bob"));
    EXPECT_EQ(cardOf("bob", {card("a", {identityOf(1, "A")})}), "refused -2013");
}

TEST_F(LoginPolicyTest, JudgesOneCardByTheSameRules) {
    pair("alice", 1);
    pair("alice", 3);
    pair("bob", 2);
    const std::vector<Token> inserted{
        card("a", {identityOf(1, "A"), identityOf(2, "B"), expired(3)})};
    const auto judged = [&](const std::string& account, const std::string& token,
                            std::uint8_t key) {
        return chosen(policy.thisCard(account, "pkcs11:token=" + token, hashOf(key), inserted));
    };

    EXPECT_EQ(judged("alice", "a", 1), "alice a A");
    EXPECT_EQ(judged("alice", "a", 2), "refused -2018") << "it is paired with another account";
    EXPECT_EQ(judged("alice", "a", 3), "refused -2020");
    EXPECT_EQ(judged("alice", "a", 4), "refused -2018") << "there is no such key";
    EXPECT_EQ(judged("alice", "b", 1), "refused -2004") << "that card is not inserted";
}

}  // namespace
}  // namespace vlm::service
