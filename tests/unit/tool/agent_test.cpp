#include "tool/agent.h"

#include <algorithm>
#include <thread>

#include "tool_fixture.h"

namespace vlm {
namespace {

using platform::PreferencesUser;

const std::string kNewToken = "org.vlm.token.new-token";
const std::string kForced = "org.vlm.vlmbind.force-bind-ui";

// Holds its operation until it is closed, as the real one does.
class QuietDialog final : public PairingDialog {
public:
    explicit QuietDialog(std::shared_ptr<BindOperation> operation)
        : _operation(std::move(operation)) {}

    bool showWindow() override { return true; }
    void refreshIdentities() override {}
    void close() override {}
    void showAlert(const platform::Alert&, std::function<void()> dismissed) override {
        dismissed();
    }

private:
    const std::shared_ptr<BindOperation> _operation;
};

// An agent of alice, who sits at the machine, where the dialog is enabled.
class AgentTest : public ToolTest {
protected:
    void SetUp() override {
        ToolTest::SetUp();
        fakes::settings().values["UserPairing"] = 1;
        accounts().add("alice", 1000);
        process().runAs(1000, "alice");
        sessions().login(1000, true);
        agent = std::make_shared<Agent>([this](const std::shared_ptr<BindOperation>& made) {
            operation = made;
            return std::make_shared<QuietDialog>(made);
        });
        application().setEventHandler(
            [this](const std::string& notification) { agent->handleEvent(notification); });
    }

    void allow(bool allowed) {
        preferences().put("UserPairing", "org.vlm.smartcard", PreferencesUser::Current, allowed);
    }

    // A card that is offered: the operation has its dialog when this returns.
    void startWithACard(const std::string& notification = kNewToken) {
        insertBlue();
        tokenFramework().insert(blue);
        application().deliver(notification);
        workQueues().runBackground();
        tokenFramework().deliver();
        workQueues().runMain();
        ASSERT_FALSE(operation.expired());
    }

    std::ptrdiff_t count(const std::string& text) {
        return std::ranges::count(log().lines(), text, &fakes::RecordingSystemLog::Line::text);
    }

    void end(BindResult result, const std::optional<platform::Error>& error = std::nullopt) {
        operation.lock()->finishWithResult(result, std::nullopt, error);
        workQueues().runMain();
    }

    std::shared_ptr<Agent> agent;
    std::weak_ptr<BindOperation> operation;
};

TEST_F(AgentTest, ANewTokenStartsABind) {
    startWithACard();

    EXPECT_TRUE(debugged("starting vlm bind"));
    EXPECT_EQ(application().openTransactions, 1);
    EXPECT_EQ(application().exits, 0);

    end(BindResult::Canceled);
}

TEST_F(AgentTest, WhatANotificationLeadsToIsSaidInItsActivity) {
    application().deliver(kNewToken);

    for (const auto& line : log().lines()) EXPECT_EQ(line.activity, "new token notification");
    EXPECT_FALSE(log().lines().empty());
    workQueues().runBackground();
}

TEST_F(AgentTest, OfTwoNotificationsInQuickSuccessionOneStartsABind) {
    startWithACard();
    application().deliver(kNewToken);
    application().deliver(kForced);

    EXPECT_EQ(count("starting vlm bind"), 1);
    EXPECT_EQ(count("vlm bind is already running"), 2);
    EXPECT_EQ(application().openTransactions, 1);
    EXPECT_EQ(application().exits, 0) << "the running one goes on";

    end(BindResult::Canceled);
}

TEST_F(AgentTest, EndsAtOnceWhereTheUserSwitchedTheDialogOff) {
    allow(false);

    application().deliver(kNewToken);

    EXPECT_TRUE(noticed("vlm bind is not allowed, exiting"));
    EXPECT_EQ(application().exitStatus, 0);
    EXPECT_FALSE(debugged("starting vlm bind"));
    EXPECT_EQ(application().openTransactions, 0);
}

TEST_F(AgentTest, ShowsTheDialogToWhoSwitchedItOffAndAsksForIt) {
    allow(false);

    startWithACard(kForced);

    EXPECT_TRUE(debugged("starting vlm bind"));
    EXPECT_EQ(application().exits, 0);
    end(BindResult::Canceled);
}

TEST_F(AgentTest, EndsAtOnceWhereTheMachineHasItDisabledWhoeverAsks) {
    fakes::settings().values["UserPairing"] = 0;

    for (const auto& notification : {kNewToken, kForced}) {
        application().startAnew();
        application().deliver(notification);
        EXPECT_EQ(application().exitStatus, 0) << notification;
    }

    EXPECT_EQ(count("vlm bind is not enabled, exiting"), 2);
    EXPECT_FALSE(debugged("starting vlm bind"));
}

TEST_F(AgentTest, AnyOtherNotificationIsPassedOver) {
    for (const char* other : {"", "org.vlm.token", "org.vlm.token.new-token.", "ORG.VLM"})
        application().deliver(other);

    EXPECT_EQ(application().exits, 0);
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(AgentTest, WithNothingToOfferTheBindIsInterruptedAndTheAgentEndsWell) {
    application().deliver(kNewToken);
    workQueues().runBackground();

    EXPECT_TRUE(debugged("vlm bind interrupted"));
    EXPECT_TRUE(noticed("no bind is running, exiting"));
    EXPECT_EQ(application().exitStatus, 0);
    EXPECT_EQ(application().openTransactions, 0);
}

TEST_F(AgentTest, SaysHowTheBindEndedAndEndsWellWhateverThatWas) {
    const std::pair<BindResult, const char*> ends[] = {
        {BindResult::Succeeded, "vlm bind succeeded"},
        {BindResult::Canceled, "vlm bind canceled"},
        {BindResult::NotOffered, "vlm bind interrupted"},
        {BindResult{42}, "vlm bind finished with unknown result: 42"},
    };
    for (const auto& [result, line] : ends) {
        application().startAnew();
        startWithACard();
        end(result);

        EXPECT_TRUE(debugged(line));
        EXPECT_EQ(application().exitStatus, 0) << line;
        EXPECT_EQ(application().openTransactions, 0) << line;
        EXPECT_TRUE(operation.expired()) << line;
    }
}

TEST_F(AgentTest, NamesTheErrorOfABindThatFailed) {
    startWithACard();
    end(BindResult::Failed, platform::Error{"VLErrorDomain", -8, "no such card"});

    EXPECT_TRUE(debugged("vlm bind failed: " +
                         platform::toText(platform::Error{"VLErrorDomain", -8, "no such card"})));
    EXPECT_EQ(application().exitStatus, 0);
}

TEST_F(AgentTest, ClosesItsTransactionBeforeItEnds) {
    startWithACard();
    end(BindResult::Canceled);

    EXPECT_EQ(application().openAtExit, 0);
}

TEST_F(AgentTest, BearsToBeToldTheEndTwice) {
    startWithACard();
    const auto kept = operation.lock();
    end(BindResult::Canceled);
    kept->reply()(BindResult::Canceled, std::nullopt);

    EXPECT_EQ(application().exits, 1);
    EXPECT_EQ(count("vlm bind canceled"), 1);
}

TEST_F(AgentTest, TakesTheEndOnAnyThread) {
    startWithACard();
    const auto reply = operation.lock()->reply();

    std::thread([reply] { reply(BindResult::NotOffered, std::nullopt); }).join();

    EXPECT_EQ(application().exitStatus, 0);
    operation.lock()->setDialog(nullptr);
}

}  // namespace
}  // namespace vlm
