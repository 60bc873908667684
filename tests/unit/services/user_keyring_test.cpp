// What the daemon has a user's own instance do with the login keyring.

#include <gmock/gmock.h>

#include "hints_service_fixture.h"

namespace vlm::service {
namespace {

using testing::HasSubstr;

class UserKeyringTest : public HintsServiceTest {
protected:
    static IncomingRequest name(std::int64_t user) {
        return requestOf(8, {{"uid", signedNumber(user)}});
    }
    static IncomingRequest unlock(std::int64_t user) {
        return requestOf(5, {{"uid", signedNumber(user)}, {"str1", text("open sesame")}});
    }
};

TEST_F(UserKeyringTest, IsNamedForItsUserAndForRoot) {
    for (const auto& caller : {alice(), root()}) {
        ASSERT_FALSE(ask(caller, name(1000)));

        keyrings.tellName(std::string("/keyring/login"));

        EXPECT_EQ(result(lastReply()), 0);
        EXPECT_EQ(*lastReply()->text("str1"), "/keyring/login");
    }
    EXPECT_EQ(keyrings.users, (std::vector<platform::UserId>{1000, 1000}));
}

TEST_F(UserKeyringTest, IsNamedForNobodyElse) {
    EXPECT_EQ(result(ask(alice(), name(1001))), status::kNotPermitted);
    EXPECT_TRUE(keyrings.users.empty());
}

TEST_F(UserKeyringTest, IsRefusedInWholeSentences) {
    ask(alice(), name(1000));

    keyrings.tellName(Refusal{status::kNoKeyring, "there is none."});

    EXPECT_EQ(result(lastReply()), status::kNoKeyring);
    EXPECT_EQ(errorText(lastReply()), "Naming the login keyring of user 1000: there is none.");
}

TEST_F(UserKeyringTest, IsForgottenWhenItsCallerLeaves) {
    ask(alice(), name(1000));
    send(alice(), unlock(1000));

    callers.leave(alice().connection);

    EXPECT_EQ(keyrings.names.count() + keyrings.unlockings.count(), 0u);
}

TEST_F(UserKeyringTest, IsUnlockedForRoot) {
    ASSERT_FALSE(ask(root(), unlock(1000)));
    EXPECT_EQ(keyrings.users, (std::vector<platform::UserId>{1000}));
    EXPECT_EQ(keyrings.passwordsGiven, (std::vector<std::string>{"open sesame"}));

    keyrings.finishUnlocking(std::nullopt);

    EXPECT_EQ(result(lastReply()), 0);
}

TEST_F(UserKeyringTest, SaysWhyItWasNotUnlocked) {
    ask(root(), unlock(1000));

    keyrings.finishUnlocking(Refusal{status::kKeyringRefused, "it refused."});

    EXPECT_EQ(result(lastReply()), status::kKeyringRefused);
    EXPECT_EQ(errorText(lastReply()), "Unlocking a login keyring: it refused.");
    for (const auto& line : log().lines()) EXPECT_THAT(line.text, Not(HasSubstr("sesame")));
}

}  // namespace
}  // namespace vlm::service
