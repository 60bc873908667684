#include "services/hints/forwarding_service.h"

#include <gmock/gmock.h>

#include "cards.h"
#include "fake_caller_watch.h"
#include "fake_daemon_link.h"
#include "fake_login_keyring.h"
#include "platform/token_framework.h"
#include "platform_test.h"
#include "services/hints/reply.h"
#include "services/hints/status.h"

namespace vlm::service {
namespace {

class ForwardingServiceTest : public fakes::PlatformTest {
protected:
    ForwardingServiceTest() {
        accounts().add("alice", 1000);
        process().runAs(1000, "alice");
    }

    void ask(const IncomingRequest& request) {
        service.handle(alice, request,
                       [this](platform::Message answer) { replies.push_back(std::move(answer)); });
    }
    std::string errorText() const {
        std::optional<platform::Error> error;
        if (replies.empty() || platform::decodeReplyError(replies[0], &error) || !error)
            return "(no error)";
        return error->description();
    }

    const Caller alice{1000, 20, ":1.20"};
    fakes::FakeDaemonLink daemon;
    fakes::FakeCallerWatch callers;
    fakes::FakeLoginKeyring keyring;
    ForwardingService service{daemon, keyring, callers};
    std::vector<platform::Message> replies;
};

IncomingRequest ownLogin() {
    return requestOf(0, {{"dat1", hashOf(1)}, {"str1", "t"}, {"uid", signedNumber(1000)}});
}

TEST_F(ForwardingServiceTest, PassesTheRequestOnAsItIsAndTheAnswerBack) {
    const auto request = ownLogin();

    ask(request);
    ASSERT_EQ(daemon.requests.size(), 1u);
    EXPECT_EQ(daemon.requests[0], request.message);
    EXPECT_TRUE(replies.empty());
    daemon.answer(numberReply(0));

    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(replies[0], numberReply(0));
    EXPECT_EQ(callers.watching(), 0u);
}

IncomingRequest unlock(const std::string& password) {
    return requestOf(5, {{"uid", signedNumber(1000)}, {"str1", text(password)}});
}

struct Rule {
    const char* why;
    IncomingRequest request;
    platform::Status status;  // 0 when it is passed on
};

TEST_F(ForwardingServiceTest, PassesOnWhatAUserMayAskAndRefusesTheRest) {
    const Rule rules[] = {
        {"a login", ownLogin(), 0},
        {"a listing", requestOf(1, {{"uid", signedNumber(-1)}}), 0},
        {"another's keyring", requestOf(5, {{"uid", signedNumber(1001)}, {"str1", "x"}}),
         status::kNotPermitted},
        {"a listing for another", requestOf(1, {{"uid", signedNumber(1001)}}),
         status::kNotPermitted},
        {"a pairing", requestOf(2, {{"dat1", hashOf(1)}, {"str1", "alice"}}), status::kNotServed},
        {"an unpairing", requestOf(3, {{"dat1", hashOf(1)}, {"str1", "alice"}}),
         status::kNotServed},
        {"pairings", requestOf(4, {{"num1", signedNumber(0)}, {"str1", "alice"}}),
         status::kNotServed},
        {"whether paired", requestOf(6, {{"str1", "alice"}}), status::kNotServed},
        {"endpoints", requestOf(7, {{"uid", signedNumber(1000)}}), status::kNotServed},
        {"no request", {}, status::kBadRequest},
    };
    for (const auto& [why, request, expected] : rules) {
        SCOPED_TRACE(why);
        replies.clear();
        daemon.requests.clear();

        ask(request);

        EXPECT_EQ(daemon.requests.size(), expected == 0 ? 1u : 0u);
        ASSERT_EQ(replies.size(), expected == 0 ? 0u : 1u);
        if (expected == 0) {
            daemon.answer(numberReply(0));
            continue;
        }
        EXPECT_EQ(replies[0].integer("res"), expected);
        EXPECT_NE(errorText(), "(no error)");
        EXPECT_EQ(errorText().find("org.vlm.token.hints.daemon") != std::string::npos,
                  expected == status::kNotServed);
    }
}

TEST_F(ForwardingServiceTest, UnlocksTheKeyringOfItsUserItself) {
    keyring.makeOne("open sesame");

    ask(unlock("open sesame"));
    EXPECT_TRUE(replies.empty());
    keyring.settle();

    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(replies[0], numberReply(0));
    EXPECT_TRUE(daemon.requests.empty());
    EXPECT_EQ(callers.watching(), 0u);
}

TEST_F(ForwardingServiceTest, SaysWhyTheKeyringWasNotUnlocked) {
    keyring.makeOne("open sesame");

    ask(unlock("wrong"));
    keyring.settle();

    EXPECT_EQ(replies.at(0).integer("res"), status::kKeyringRefused);
    EXPECT_EQ(errorText(), "Unlocking a login keyring: the login keyring refused the password.");
}

TEST_F(ForwardingServiceTest, LeavesAnotherUsersKeyringToTheDaemon) {
    const Caller root{0, 30, ":1.30"};
    service.handle(root, requestOf(5, {{"uid", signedNumber(1001)}, {"str1", "x"}}),
                   [](const platform::Message&) {});

    EXPECT_EQ(daemon.requests.size(), 1u);
    EXPECT_EQ(keyring.open(), 0u);
}

TEST_F(ForwardingServiceTest, GivesUpTheUnlockingWhenItsCallerLeaves) {
    ask(unlock("open sesame"));
    ASSERT_EQ(keyring.open(), 1u);

    callers.leave(alice.connection);

    EXPECT_EQ(keyring.open(), 0u);
}

TEST_F(ForwardingServiceTest, SaysSoWhenTheDaemonDoesNotAnswer) {
    ask(ownLogin());

    daemon.answer(Refusal{status::kUnreachable, "There is no daemon."});

    ASSERT_EQ(replies.size(), 1u);
    EXPECT_EQ(replies[0].integer("res"), status::kUnreachable);
    EXPECT_EQ(errorText(), "There is no daemon.");
}

TEST_F(ForwardingServiceTest, GivesUpTheCallWhenItsCallerLeaves) {
    ask(ownLogin());
    ASSERT_EQ(daemon.open(), 1u);

    callers.leave(alice.connection);

    EXPECT_EQ(daemon.open(), 0u);
    EXPECT_TRUE(replies.empty());
}

TEST_F(ForwardingServiceTest, AnswersInWhateverOrderTheDaemonDoes) {
    ask(ownLogin());
    ask(requestOf(1, {{"uid", signedNumber(-1)}}));

    daemon.answer(numberReply(1));
    daemon.answer(numberReply(2));

    ASSERT_EQ(replies.size(), 2u);
    EXPECT_EQ(replies[0], numberReply(1));
    EXPECT_EQ(replies[1], numberReply(2));
}

}  // namespace
}  // namespace vlm::service
