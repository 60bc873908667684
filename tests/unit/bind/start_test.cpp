// What an operation makes sure of before it watches tokens.

#include "bind/bind_operation.h"
#include "fake_process_info.h"
#include "lifecycle_fixture.h"
#include "settings/known_settings.h"

namespace vlm {
namespace {

using platform::LogLevel;

class Start : public LifecycleTest {
protected:
    // Starts, and expects that the user may not pair.
    void expectNothingOffered() {
        start();

        EXPECT_EQ(events.take(), Happened{"report 3"});
        EXPECT_EQ(reportedError, std::nullopt);
        EXPECT_EQ(tokens.watchersMade, 0);
        EXPECT_FALSE(workQueues().advanceToNext()) << "no check is waited for";
    }

    void oneCardPerUser() {
        preferences().put("oneCardPerUser", std::string(kSmartcardDomain),
                          platform::PreferencesUser::Any, true);
    }
};

TEST_F(Start, ReturnsBeforeAnythingIsDone) {
    insertBlue();

    operation->startWithReply(reply());

    EXPECT_EQ(events.take(), Happened());
    EXPECT_EQ(askedForTokens(), 0);
    workQueues().runBackground();
}

TEST_F(Start, IsRefusedForAccountsThatAreNoPersons) {
    insertBlue();
    for (const std::string account : {"gnome-initial-setup", "sbuild"}) {
        process().runAs(110, account);
        operation = makeOperation(account);

        expectNothingOffered();

        EXPECT_TRUE(noticed("invalid current user: " + account));
    }
    EXPECT_EQ(ipc().connections, 0);
}

TEST_F(Start, ComparesReservedAccountsExactly) {
    insertBlue();
    for (const std::string account : {"Sbuild", "sbuild2", "gnome-initial", "guests", "Guest"}) {
        process().runAs(1000, account);
        operation = makeOperation(account);

        start();

        EXPECT_EQ(events.take(), Happened()) << account;
    }
    EXPECT_EQ(tokens.watchersMade, 5);
}

TEST_F(Start, IsRefusedForAProcessWithoutAnOwner) {
    class Ownerless final : public platform::ProcessInfo {
        platform::UserId realUserId() const override { return 1000; }
        platform::UserId effectiveUserId() const override { return 1000; }
        std::string ownerUserName() const override { return ""; }
    } ownerless;
    fakePlatform().processInfo = &ownerless;
    operation = makeOperation("");

    expectNothingOffered();

    EXPECT_TRUE(noticed("invalid current user: "));
}

TEST_F(Start, IsRefusedForAnotherUserWithoutAskingForTokens) {
    insertBlue();
    operation = makeOperation("bob");

    expectNothingOffered();

    EXPECT_TRUE(noticed("User 'alice' is not in active session"));
    EXPECT_EQ(ipc().connections, 0);
}

TEST_F(Start, IsRefusedWhenNobodyIsAtTheConsole) {
    operation = BindOperation::init();
    ASSERT_EQ(operation->userName(), std::nullopt);

    expectNothingOffered();

    EXPECT_TRUE(noticed("User 'alice' is not in active session"));
}

TEST_F(Start, NamesAReservedAccountBeforeItLooksWhoseOperationItIs) {
    process().runAs(110, "sbuild");

    expectNothingOffered();

    EXPECT_TRUE(noticed("invalid current user: sbuild"));
    EXPECT_FALSE(noticed("User 'sbuild' is not in active session"));
}

TEST_F(Start, IsRefusedForTheGuestWhoseAccountIsLookedUpFirst) {
    insertBlue();
    process().runAs(1005, "guest");
    accounts().add("guest", 1005);
    operation = makeOperation("guest");

    expectNothingOffered();

    ASSERT_EQ(log().lines().size(), 2U);
    EXPECT_EQ(log().lines()[0].level, LogLevel::Debug);
    EXPECT_EQ(log().lines()[0].text, "account of the current user: guest, id: 1005");
    EXPECT_EQ(log().lines()[1].level, LogLevel::Default);
    EXPECT_EQ(log().lines()[1].text, "current user is guest account");
    EXPECT_EQ(ipc().connections, 0);
}

TEST_F(Start, LooksUpAnAccountThatTheDatabaseDoesNotKnow) {
    insertBlue();
    process().runAs(1007, "carol");
    operation = makeOperation("carol");

    start();

    EXPECT_TRUE(debugged("account of the current user: carol, id: (null)"));
    EXPECT_EQ(tokens.watchersMade, 1);
}

TEST_F(Start, IsRefusedForAUserWithACardWhereOneIsAllThereMayBe) {
    insertBlue();
    oneCardPerUser();
    service.pair("alice", redSigning);

    expectNothingOffered();

    EXPECT_TRUE(noticed("Cannot pair user which is already paired"));
    EXPECT_EQ(askedForTokens(), 0);
}

TEST_F(Start, AllowsTheFirstCardWhereOneIsAllThereMayBe) {
    insertBlue();
    oneCardPerUser();

    start();

    EXPECT_EQ(tokens.watchersMade, 1);
}

TEST_F(Start, AllowsASecondCardAndDoesNotAskForTheFirst) {
    insertBlue();
    service.pair("alice", redSigning);

    start();

    EXPECT_EQ(tokens.watchersMade, 1);
    EXPECT_EQ(service.requests[Service::kIsUserBound], 0);
}

TEST_F(Start, OffersNothingWithoutACard) {
    expectNothingOffered();

    EXPECT_TRUE(noticed("no unpaired identities found"));
    EXPECT_TRUE(noticed("updateTokenCache for token: (null) (requireWrapKey: 1)"));
    EXPECT_EQ(askedForTokens(), 1);
}

TEST_F(Start, OffersNothingOfACardThatCannotWrapAnUnlockKey) {
    insertRedWithoutWrapKey();

    expectNothingOffered();

    EXPECT_TRUE(noticed("no unpaired identities found"));
}

TEST_F(Start, OffersNothingWithoutTheService) {
    ipc().serve({});

    expectNothingOffered();
}

TEST_F(Start, FillsTheCacheAnew) {
    insertBlue();
    operation->setUnpairedIdentities(Identities{{red, {{redSigning, "Bob"}}}});

    start();

    EXPECT_EQ(offered(),
              (Identities{{blue, {{blueSigning, "Alice"}, {blueMail, "Alice (mail)"}}}}));
}

TEST_F(Start, WatchesTokensAndReportsNothingYet) {
    insertBlue();

    start();

    EXPECT_EQ(events.take(), Happened());
    EXPECT_EQ(tokens.watchersMade, 1);
    EXPECT_EQ(operation->tokenWatcher(), tokens.watcher.lock());
}

TEST_F(Start, SchedulesItsCheckBeforeItWatches) {
    insertBlue();
    class Watched final : public platform::TokenFramework {
    public:
        explicit Watched(fakes::FakeWorkQueues& queues) : _queues(queues) {}
        std::shared_ptr<platform::TokenWatcher> watchTokens() override {
            isCheckScheduled = _queues.advanceToNext();
            return std::make_shared<ScriptedWatcher>(std::set<std::string>());
        }
        bool isCheckScheduled = false;

    private:
        fakes::FakeWorkQueues& _queues;
    } watched(workQueues());
    fakePlatform().tokenFramework = &watched;

    start();
    workQueues().runMain();
    workQueues().runBackground();

    EXPECT_TRUE(watched.isCheckScheduled);
}

TEST_F(Start, DoesNothingWhenTheOperationIsGone) {
    insertBlue();
    operation->startWithReply(reply());
    operation.reset();

    workQueues().runBackground();

    EXPECT_EQ(events.take(), Happened());
    EXPECT_EQ(tokens.watchersMade, 0);
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(Start, NeedsNoReply) {
    operation->startWithReply(nullptr);
    workQueues().runBackground();

    EXPECT_TRUE(noticed("no unpaired identities found"));
}

TEST_F(Start, MayComeAgainFromTheReplyItself) {
    operation->startWithReply([this](BindResult, const auto&) {
        events.add("first reply");
        operation->startWithReply(reply());
    });

    workQueues().runBackground();

    EXPECT_EQ(events.take(), (Happened{"first reply", "report 3"}));
}

TEST_F(Start, MayEndTheLifeOfTheOperationInItsReply) {
    std::weak_ptr<BindOperation> gone = operation;
    operation->startWithReply([this](BindResult, const auto&) { operation.reset(); });

    workQueues().runBackground();

    EXPECT_TRUE(gone.expired());
}

}  // namespace
}  // namespace vlm
