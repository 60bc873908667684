#include "services/hints/login_search.h"

#include <gmock/gmock.h>

#include "hints_service_fixture.h"
#include "settings/known_settings.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

class LoginSearchTest : public HintsServiceTest {
protected:
    void insertCard(PinState state = PinState::Ready, bool hasPinPad = false) {
        auto card = tokenOf("pkcs11:token=a", "PIV Card", {identityOf(1, "Alice")});
        card.pinState = state;
        card.hasPinPad = hasPinPad;
        tokens.insert(card);
        pairings.pair("alice", hashOf(1), kNow);
    }
    void requireCards() {
        preferences().put("enforceSmartCard", std::string(kSmartcardDomain),
                          platform::PreferencesUser::Any, 1);
    }

    static IncomingRequest search(const std::string& account) {
        return requestOf(11, {{"str1", account}});
    }
    static IncomingRequest searchForAnybody() { return requestOf(11); }
};

TEST_F(LoginSearchTest, NamesTheCardOfAnAccount) {
    insertCard();

    const auto reply = ask(root(), search("alice"));

    EXPECT_EQ(result(reply), 0);
    EXPECT_EQ(*reply->text("str1"), "alice");
    EXPECT_EQ(*reply->text("str2"), "pkcs11:token=a");
    EXPECT_EQ(*reply->text("str3"), "PIV Card");
    EXPECT_EQ(*reply->bytes("dat1"), hashOf(1));
    EXPECT_EQ(reply->integer("num1"), 0);
}

TEST_F(LoginSearchTest, NamesTheAccountOfACardForRootOnly) {
    insertCard();

    EXPECT_EQ(*ask(root(), searchForAnybody())->text("str1"), "alice");
    EXPECT_EQ(result(ask(alice(), searchForAnybody())), status::kNotPermitted);
    EXPECT_EQ(result(ask(alice(), search("bob"))), status::kNotPermitted);
    EXPECT_EQ(result(ask(alice(), search("nobody-here"))), status::kNotPermitted);
}

TEST_F(LoginSearchTest, TellsOfThePadAndTheTries) {
    struct Row {
        PinState state;
        bool hasPinPad;
        std::int64_t flags;
    };
    for (const auto& [state, hasPinPad, flags] :
         {Row{PinState::Ready, true, 1}, Row{PinState::FewTriesLeft, false, 2},
          Row{PinState::LastTry, false, 4}, Row{PinState::LastTry, true, 5}}) {
        tokens.pull("pkcs11:token=a");
        insertCard(state, hasPinPad);

        EXPECT_EQ(ask(root(), search("alice"))->integer("num1"), flags);
    }
    requireCards();
    EXPECT_EQ(ask(root(), search("alice"))->integer("num1"), 13) << "there is no other way in";
}

TEST_F(LoginSearchTest, SaysWhatCountsWithoutACard) {
    EXPECT_EQ(result(ask(root(), search("alice"))), status::kNoLoginCard);
    EXPECT_EQ(result(ask(root(), searchForAnybody())), status::kNoLoginCard);
    requireCards();
    EXPECT_EQ(result(ask(root(), search("alice"))), status::kCardRequired);
    EXPECT_THAT(errorText(lastReply()), HasSubstr("Logging in alice with a card: only a card"));
}

TEST_F(LoginSearchTest, ServesAUserInASessionAtThisMachine) {
    insertCard();
    struct Row {
        SessionState state;
        platform::Status status;
    };
    for (const auto& [state, status] :
         {Row{SessionState::Attended, 0}, Row{SessionState::Locked, 0},
          Row{SessionState::None, status::kUnattended},
          Row{SessionState::Away, status::kUnattended},
          Row{SessionState::Inactive, status::kUnattended},
          Row{SessionState::Unknown, status::kUnattended}}) {
        sessions.state = state;

        EXPECT_EQ(result(ask(alice(), search("alice"))), status) << static_cast<int>(state);
    }
}

TEST_F(LoginSearchTest, AsksForNoSessionOfRoot) {
    insertCard();
    sessions.state = SessionState::None;

    EXPECT_EQ(result(ask(root(), search("alice"))), 0);
}

TEST_F(LoginSearchTest, HasNoEffectWhenItsCallerLeaves) {
    insertCard();
    send(alice(), search("alice"));
    callers.leave(alice().connection);
    settle();
    EXPECT_EQ(tokens.listings, 0);

    send(root(), search("alice"));
    callers.leave(root().connection);
    settle();

    EXPECT_EQ(lastReply(), std::nullopt);
}

}  // namespace
}  // namespace vlm::service
