// Polkit's side is a small one of our own, which answers when the test says so; the real one is in
// tests/lab/scenarios/right.py.

#include "services/hints/polkit_authority.h"

#include <gmock/gmock.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "bus_test.h"

namespace vlm::service {
namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Pair;
using Outcome = RightVerdict::Outcome;

class SmallPolkit {
public:
    struct Check {
        platform::SdBusMessage call;
        std::string kind;
        std::string name;
        std::string action;
        std::map<std::string, std::string> details;
        std::uint32_t flags = 0;
        std::string id;
    };
    using Details = std::vector<std::pair<std::string, std::string>>;

    explicit SmallPolkit(platform::SdBus connection) : _bus(std::move(connection)) {
        EXPECT_GE(sd_bus_request_name(_bus.get(), "org.freedesktop.PolicyKit1", 0), 0);
        sd_bus_slot* slot = nullptr;
        sd_bus_add_object(_bus.get(), &slot, "/org/freedesktop/PolicyKit1/Authority", onCall, this);
        _slot.reset(slot);
    }

    std::vector<Check> checks;
    std::vector<std::string> cancelled;

    void answer(std::size_t number, bool isAuthorized, bool isChallenge,
                const Details& details = {}) {
        sd_bus_message* reply = nullptr;
        sd_bus_message_new_method_return(checks.at(number).call.get(), &reply);
        const platform::SdBusMessage owner(reply);
        sd_bus_message_open_container(reply, 'r', "bba{ss}");
        sd_bus_message_append(reply, "bb", int{isAuthorized}, int{isChallenge});
        sd_bus_message_open_container(reply, 'a', "{ss}");
        for (const auto& [key, value] : details)
            sd_bus_message_append(reply, "{ss}", key.c_str(), value.c_str());
        sd_bus_message_close_container(reply);
        sd_bus_message_close_container(reply);
        EXPECT_GE(sd_bus_send(nullptr, reply, nullptr), 0);
    }
    void answerWithError() {
        sd_bus_reply_method_errorf(checks.at(0).call.get(),
                                   "org.freedesktop.PolicyKit1.Error.Failed", "no such action");
    }
    void answerNonsense() { sd_bus_reply_method_return(checks.at(0).call.get(), "s", "yes"); }
    const char* name() const {
        const char* unique = nullptr;
        sd_bus_get_unique_name(_bus.get(), &unique);
        return unique;
    }

private:
    // No table of members: it would not let nonsense out.
    static int onCall(sd_bus_message* call, void* self, sd_bus_error* error) {
        const bool isCheck =
            sd_bus_message_is_method_call(call, "org.freedesktop.PolicyKit1.Authority",
                                          "CheckAuthorization") > 0;
        return isCheck ? onCheck(call, self, error) : onCancel(call, self, error);
    }
    static int onCheck(sd_bus_message* call, void* self, sd_bus_error*) {
        Check check;
        const char* kind = nullptr;
        const char* subject = nullptr;
        const char* name = nullptr;
        const char* action = nullptr;
        const char* id = nullptr;
        EXPECT_GE(sd_bus_message_read(call, "(sa{sv})s", &kind, 1, &subject, "s", &name, &action),
                  0);
        sd_bus_message_enter_container(call, 'a', "{ss}");
        const char* key = nullptr;
        const char* value = nullptr;
        while (sd_bus_message_read(call, "{ss}", &key, &value) > 0) check.details[key] = value;
        sd_bus_message_exit_container(call);
        EXPECT_GE(sd_bus_message_read(call, "us", &check.flags, &id), 0);
        check.kind = kind;
        check.name = name;
        check.action = action;
        check.id = id;
        check.call.reset(sd_bus_message_ref(call));
        static_cast<SmallPolkit*>(self)->checks.push_back(std::move(check));
        return 1;
    }
    static int onCancel(sd_bus_message* call, void* self, sd_bus_error*) {
        const char* id = nullptr;
        sd_bus_message_read(call, "s", &id);
        static_cast<SmallPolkit*>(self)->cancelled.emplace_back(id);
        return sd_bus_reply_method_return(call, "");
    }

    platform::SdBus _bus;
    platform::SdBusSlot _slot;
};

class PolkitAuthorityTest : public BusTest {
protected:
    void ask(Authority& asked) {
        _questions.push_back(
            asked.ask({{1000, 20, ":1.20"}, "May $(account) do it?", {{"account", "alice"}}},
                      [this](const RightVerdict& verdict) { verdicts.push_back(verdict); }));
    }
    void askAndWait(Authority& asked) {
        const auto before = polkit->checks.size();
        ask(asked);
        runUntil([&] { return polkit->checks.size() > before; });
    }
    RightVerdict verdict() {
        runUntil([&] { return !verdicts.empty(); });
        return verdicts.empty() ? RightVerdict{} : verdicts.front();
    }
    void withdraw() { _questions.clear(); }

    std::optional<SmallPolkit> polkit{connect()};
    std::vector<RightVerdict> verdicts;

private:
    platform::SdBus _connection = connect();

protected:
    sd_bus* connection() const { return _connection.get(); }
    PolkitAuthority authority{_connection.get()};

private:
    std::vector<std::unique_ptr<Authority::Question>> _questions;
};

TEST_F(PolkitAuthorityTest, AsksAboutTheCallersConnectionAndLetsThePersonBeAsked) {
    askAndWait(authority);

    const auto& check = polkit->checks.at(0);
    EXPECT_EQ(check.kind, "system-bus-name");
    EXPECT_EQ(check.name, ":1.20");
    EXPECT_EQ(check.action, "org.vlm.vlmbind.admin");
    EXPECT_EQ(check.flags, 1u);
    EXPECT_THAT(check.details, ElementsAre(Pair("account", "alice"),
                                           Pair("polkit.message", "May $(account) do it?")));
    EXPECT_FALSE(check.id.empty());
}

struct Answer {
    const char* why;
    bool isAuthorized;
    bool isChallenge;
    SmallPolkit::Details details;
    Outcome outcome;
};

TEST_F(PolkitAuthorityTest, TellsTheVerdictsApart) {
    const Answer answers[] = {
        {"allowed by a rule", true, false, {}, Outcome::Granted},
        {"dismissed", false, false, {{"polkit.dismissed", "true"}}, Outcome::Dismissed},
        {"a wrong password", false, false, {}, Outcome::Denied},
        {"no agent", false, true, {}, Outcome::NobodyToAsk},
    };
    for (const auto& answer : answers) {
        SCOPED_TRACE(answer.why);
        verdicts.clear();
        askAndWait(authority);

        polkit->answer(polkit->checks.size() - 1, answer.isAuthorized, answer.isChallenge,
                       answer.details);

        EXPECT_EQ(verdict().outcome, answer.outcome);
        EXPECT_EQ(verdict().kept, "");
    }
    EXPECT_THAT(polkit->cancelled, IsEmpty());
}

// A polkit that was started anew gives the same ids again.
TEST_F(PolkitAuthorityTest, TellsWhatIsKeptAndByWhom) {
    askAndWait(authority);

    polkit->answer(0, true, false,
                   {{"other", "1"}, {"polkit.temporary_authorization_id", "tmpauthz7"}});

    EXPECT_EQ(verdict().outcome, Outcome::Granted);
    EXPECT_EQ(verdict().kept, std::string(polkit->name()) + " tmpauthz7");
}

TEST_F(PolkitAuthorityTest, WithdrawsAQuestionThatNobodyWaitsFor) {
    askAndWait(authority);

    withdraw();
    runUntil([&] { return !polkit->cancelled.empty(); });
    polkit->answer(0, true, false);
    runUntilQuiet();

    EXPECT_THAT(polkit->cancelled, ElementsAre(polkit->checks.at(0).id));
    EXPECT_THAT(verdicts, IsEmpty());
}

TEST_F(PolkitAuthorityTest, WithdrawsNothingThatWasAnswered) {
    askAndWait(authority);
    polkit->answer(0, true, false);
    EXPECT_EQ(verdict().outcome, Outcome::Granted);

    withdraw();
    runUntilQuiet();

    EXPECT_THAT(polkit->cancelled, IsEmpty());
}

TEST_F(PolkitAuthorityTest, GivesEachQuestionAnIdOfItsOwn) {
    askAndWait(authority);
    askAndWait(authority);

    EXPECT_NE(polkit->checks.at(0).id, polkit->checks.at(1).id);
}

TEST_F(PolkitAuthorityTest, WaitsForNobodyForEver) {
    PolkitAuthority hasty(connection(), 20ms);
    askAndWait(hasty);

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
    EXPECT_THAT(verdict().reason, HasSubstr("in time"));
    runUntil([&] { return !polkit->cancelled.empty(); });
    EXPECT_THAT(polkit->cancelled, ElementsAre(polkit->checks.at(0).id));
}

TEST_F(PolkitAuthorityTest, AsksNobodyAnyMoreWhenTheServiceIsAboutToEnd) {
    askAndWait(authority);
    authority.askNobody();

    ask(authority);

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
    EXPECT_THAT(verdict().reason, HasSubstr("about to end"));
    EXPECT_EQ(polkit->checks.size(), 1u);
    EXPECT_THAT(polkit->cancelled, IsEmpty());
}

TEST_F(PolkitAuthorityTest, FailsWhenPolkitEndsBeforeItAnswers) {
    askAndWait(authority);

    polkit->checks.clear();
    polkit.reset();

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
    EXPECT_FALSE(verdict().reason.empty());
}

TEST_F(PolkitAuthorityTest, FailsWithoutPolkit) {
    polkit.reset();
    ASSERT_TRUE(test::eventually([&] { return !bus.hasOwner("org.freedesktop.PolicyKit1"); }));

    ask(authority);

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
    EXPECT_THAT(verdict().reason, HasSubstr("org.freedesktop.PolicyKit1"));
}

TEST_F(PolkitAuthorityTest, FailsWhenPolkitDoes) {
    askAndWait(authority);
    polkit->answerWithError();

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
    EXPECT_EQ(verdict().reason, "no such action");
}

TEST_F(PolkitAuthorityTest, TakesNoNonsenseForAYes) {
    askAndWait(authority);
    polkit->answerNonsense();

    EXPECT_EQ(verdict().outcome, Outcome::Failed);
}

}  // namespace
}  // namespace vlm::service
