#include "services/hints/permission.h"

#include <gmock/gmock.h>

#include "cards.h"
#include "platform_test.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

class PermissionTest : public fakes::PlatformTest {
protected:
    PermissionTest() {
        accounts().add("root", 0);
        accounts().add("alice", 1000);
        accounts().add("bob", 1001);
    }
};

constexpr platform::UserId kAlice = 1000;

Request about(Operation operation, const std::string& account, platform::UserId user) {
    Request request;
    request.operation = operation;
    request.account = account;
    request.user = user;
    request.hash = hashOf(1);
    return request;
}

struct Rule {
    const char* why;
    Operation operation;
    const char* account;
    platform::UserId user;
    bool aliceMay;
};

constexpr auto kNobody = platform::kNobody;
constexpr Rule kRules[] = {
    {"log in for herself", Operation::Login, "", kAlice, true},
    {"log in with nobody at the console", Operation::Login, "", kNobody, true},
    {"log in for bob", Operation::Login, "", 1001, false},
    {"log in for root", Operation::Login, "", 0, false},
    {"list cards for herself", Operation::TokenInfo, "", kAlice, true},
    {"list cards with nobody at the console", Operation::TokenInfo, "", kNobody, true},
    {"list cards for bob", Operation::TokenInfo, "", 1001, false},
    {"list cards for root", Operation::TokenInfo, "", 0, false},
    {"pair herself", Operation::Pair, "alice", kNobody, true},
    {"pair bob", Operation::Pair, "bob", kNobody, false},
    {"unpair herself", Operation::Unpair, "alice", kNobody, true},
    {"unpair bob", Operation::Unpair, "bob", kNobody, false},
    {"pair nobody known", Operation::Pair, "mallory", kNobody, false},
    {"unpair nobody known", Operation::Unpair, "mallory", kNobody, false},
    {"list her own pairings", Operation::Pairings, "alice", kNobody, true},
    {"list the pairings of bob", Operation::Pairings, "bob", kNobody, false},
    {"list the pairings of nobody known", Operation::Pairings, "mallory", kNobody, false},
    {"look for her own card", Operation::FindLoginCard, "alice", kNobody, true},
    {"look for the card of bob", Operation::FindLoginCard, "bob", kNobody, false},
    {"look for anybody's card", Operation::FindLoginCard, "", kNobody, false},
    {"log in with her own card", Operation::CardLogin, "alice", kNobody, true},
    {"log in with the card of bob", Operation::CardLogin, "bob", kNobody, false},
    {"say which card opened a session", Operation::SessionLogin, "alice", kAlice, false},
    {"unlock her own key bag", Operation::UnlockKeybag, "", kAlice, true},
    {"unlock the key bag of bob", Operation::UnlockKeybag, "", 1001, false},
    {"ask whether she is paired", Operation::IsPaired, "alice", kNobody, true},
    {"ask whether bob is paired", Operation::IsPaired, "bob", kNobody, false},
    {"ask whether root is paired", Operation::IsPaired, "root", kNobody, false},
    {"ask whether nobody known is paired", Operation::IsPaired, "mallory", kNobody, false},
    {"watch her own cards", Operation::TokenEndpoints, "", kAlice, true},
    {"watch the cards of bob", Operation::TokenEndpoints, "", 1001, false},
    {"name her own keyring", Operation::NameKeyring, "", kAlice, true},
    {"name the keyring of bob", Operation::NameKeyring, "", 1001, false},
    {"store her own unlock key", Operation::StoreUnlockKey, "", kAlice, true},
    {"store an unlock key of bob", Operation::StoreUnlockKey, "", 1001, false},
    {"erase her own unlock key", Operation::EraseUnlockKey, "alice", kNobody, true},
    {"erase an unlock key of bob", Operation::EraseUnlockKey, "bob", kNobody, false},
    {"erase one of nobody known", Operation::EraseUnlockKey, "mallory", kNobody, false},
    {"tell of her own new password", Operation::PasswordChanged, "alice", kNobody, true},
    {"tell of a new password of bob", Operation::PasswordChanged, "bob", kNobody, false},
    {"tell of one of nobody known", Operation::PasswordChanged, "mallory", kNobody, false},
};

TEST_F(PermissionTest, LetsRootDoAllAndOthersWhatConcernsThemselves) {
    const Caller root{0, 1, ":1.1"};
    const Caller alice{kAlice, 2, ":1.2"};
    for (const auto& rule : kRules) {
        SCOPED_TRACE(rule.why);
        const auto request = about(rule.operation, rule.account, rule.user);

        EXPECT_FALSE(refusalFor(root, request));
        const auto refusal = refusalFor(alice, request);
        EXPECT_EQ(!refusal, rule.aliceMay);
        EXPECT_EQ(refusal ? refusal->status : 0, rule.aliceMay ? 0 : status::kNotPermitted);
    }
}

TEST_F(PermissionTest, TellsWhatWasRefusedAndThatAnAdministratorCanDoIt) {
    const auto refusal = refusalFor({kAlice, 2, ":1.2"}, about(Operation::Pair, "bob", kNobody));

    ASSERT_TRUE(refusal);
    EXPECT_THAT(refusal->text, testing::StartsWith("Pairing bob with 0101"));
    EXPECT_THAT(refusal->text, testing::HasSubstr("another account"));
    EXPECT_THAT(refusal->text, testing::HasSubstr("administrator"));
    EXPECT_THAT(refusal->text, testing::HasSubstr("sudo"));
}

TEST_F(PermissionTest, NeedsAnAdministratorForTheChangesOfOthersThanRoot) {
    const Caller root{0, 1, ":1.1"};
    const Caller alice{kAlice, 2, ":1.2"};
    for (const auto& rule : kRules) {
        SCOPED_TRACE(rule.why);
        const auto request = about(rule.operation, rule.account, rule.user);
        const bool isChange =
            rule.operation == Operation::Pair || rule.operation == Operation::Unpair;

        EXPECT_FALSE(needsAdministrator(root, request));
        EXPECT_EQ(needsAdministrator(alice, request), isChange);
    }
}

TEST_F(PermissionTest, TellsNobodyWhetherAnotherAccountExists) {
    const Caller alice{kAlice, 2, ":1.2"};

    const auto known = refusalFor(alice, about(Operation::IsPaired, "bob", kNobody));
    const auto unknown = refusalFor(alice, about(Operation::IsPaired, "eve", kNobody));

    ASSERT_TRUE(known && unknown);
    EXPECT_EQ(known->status, unknown->status);
    EXPECT_EQ(known->text.substr(known->text.find(':')),
              unknown->text.substr(unknown->text.find(':')));
}

}  // namespace
}  // namespace vlm::service
