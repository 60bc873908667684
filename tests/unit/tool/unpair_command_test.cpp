#include "tool_fixture.h"

namespace vlm {
namespace {

using platform::Error;

class UnpairCommand : public ToolTest {
protected:
    void SetUp() override {
        ToolTest::SetUp();
        service.pair("alice", blueSigning);
    }
};

TEST_F(UnpairCommand, TakesBackThePairingAndPrintsNothing) {
    const auto run = vlmbind({"-r", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "");
    EXPECT_TRUE(service.pairings.empty());
    EXPECT_TRUE(debugged("unpairing user alice from pubkey hash B1"));
    EXPECT_EQ(debugLines().back(), "exiting");
}

TEST_F(UnpairCommand, SaysThatTheUnpairingSucceededWhenVerbose) {
    const auto run = vlmbind({"-r", "-v", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    expectPrinted(run, {"User was successfully unpaired (public key hash: B1)."});
}

TEST_F(UnpairCommand, NeedsAHash) {
    const auto run = vlmbind({"-r", "-u", "alice"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot unpair user - no pubkey hash was provided"});
    EXPECT_TRUE(service.requests.empty());
}

TEST_F(UnpairCommand, ChecksNoPrivilegesItself) {
    for (const platform::UserId user : {0U, 1000U}) {
        service.pairings = {{"alice", blueSigning}};
        process().runAs(user);

        EXPECT_EQ(vlmbind({"-r", "-u", "alice", "-h", "B1"}).status, 0);
    }
}

TEST_F(UnpairCommand, WithoutAUserIsForTheUserAtTheConsole) {
    accounts().add("alice", 1000);
    sessions().login(1000, /*onConsole=*/true);

    const auto run = vlmbind({"-r", "-h", "B1"});

    EXPECT_EQ(run.status, 0);
    EXPECT_TRUE(service.pairings.empty());
    EXPECT_TRUE(debugged("unpairing user (null) from pubkey hash B1"));
}

TEST_F(UnpairCommand, ErasesTheUnlockKeyOfTheUserAtTheConsoleOnly) {
    accounts().add("alice", 1000);
    sessions().login(1000, /*onConsole=*/true);
    service.pair("bob", blueSigning);

    EXPECT_EQ(vlmbind({"-r", "-u", "bob", "-h", "B1"}).status, 0);
    EXPECT_TRUE(keychain().erased.empty());

    EXPECT_EQ(vlmbind({"-r", "-u", "alice", "-h", "B1"}).status, 0);
    EXPECT_EQ(keychain().erased, (std::vector<Bytes>{blueSigning}));
}

TEST_F(UnpairCommand, SaysWhyTheUnpairingFailed) {
    service.failWith(Service::kUnbindUser, -2012,
                     Error{"VLErrorDomain", -2012, "alice is not paired with this key."});

    const auto run = vlmbind({"-r", "-v", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run,
                  {"Cannot unpair user (public key hash: B1). alice is not paired with this key."});
    EXPECT_FALSE(debugged("exiting"));
}

TEST_F(UnpairCommand, SaysWhyWhenNoServiceCanBeReached) {
    ipc().serve(nullptr);

    const auto run = vlmbind({"-r", "-u", "alice", "-h", "B1"});

    EXPECT_EQ(run.status, 255);
    expectPrinted(run, {"Cannot unpair user (public key hash: B1). there is no service "
                        "org.vlm.token.hints.daemon"});
}

TEST_F(UnpairCommand, GivesTheNumberOfAFailureWithoutWords) {
    service.failWith(Service::kUnbindUser, -2013);

    expectPrinted(vlmbind({"-r", "-u", "alice", "-h", "B1"}),
                  {"Cannot unpair user (public key hash: B1). The operation could not be "
                   "completed. (VLErrorDomain error -2013)"});
}

}  // namespace
}  // namespace vlm
