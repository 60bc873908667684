#include "bind_operation_fixture.h"

namespace vlm {
namespace {

using platform::Error;

class UnpairUser : public BindOperationTest {
protected:
    bool unlockKeyTouched() { return !keychain().erased.empty(); }

    const Error notPaired{"VLErrorDomain", -2012, "alice is not paired with this key."};
    std::optional<Error> error;
};

TEST_F(UnpairUser, TakesBackThePairingAndErasesTheUnlockKeyOfItsOwnUser) {
    service.pair("alice", blueSigning);

    EXPECT_EQ(operation->unpairUser(blueSigning, "alice", &error), 0);

    EXPECT_TRUE(service.pairings.empty());
    EXPECT_EQ(keychain().erased, (std::vector<Bytes>{blueSigning}));
    EXPECT_EQ(error, std::nullopt);
    EXPECT_TRUE(debugged("VLUnbindUser: 0"));
    EXPECT_EQ(log().texts(platform::LogLevel::Default),
              (std::vector<std::string>{"unpairing keychain",
                                        "unpairUser = 0, (user = alice, pubkey hash: B1)"}));
}

TEST_F(UnpairUser, WithoutANameIsForTheOperationsUser) {
    service.pair("alice", blueSigning);

    EXPECT_EQ(operation->unpairUser(blueSigning, std::nullopt, &error), 0);

    EXPECT_TRUE(service.pairings.empty());
    EXPECT_TRUE(unlockKeyTouched());
}

TEST_F(UnpairUser, OfAnotherUserSucceedsByTheServicesStatusAndNeverTouchesTheKeychain) {
    service.pair("bob", blueSigning);

    EXPECT_EQ(operation->unpairUser(blueSigning, "bob", &error), 0);

    EXPECT_TRUE(service.pairings.empty());
    EXPECT_FALSE(unlockKeyTouched());
    EXPECT_FALSE(noticed("unpairing keychain"));
}

TEST_F(UnpairUser, OfAnotherUserFailsByTheServicesStatusAndNeverTouchesTheKeychain) {
    service.failWith(Service::kUnbindUser, -2012, notPaired);

    EXPECT_EQ(operation->unpairUser(blueSigning, "bob", &error), -2012);

    EXPECT_EQ(error, notPaired);
    EXPECT_FALSE(unlockKeyTouched());
}

TEST_F(UnpairUser, LeavesTheUnlockKeyWhenTheServiceRefuses) {
    service.failWith(Service::kUnbindUser, -2012, notPaired);

    EXPECT_EQ(operation->unpairUser(blueSigning, "alice", &error), -2012);

    EXPECT_EQ(error, notPaired);
    EXPECT_FALSE(unlockKeyTouched());
    EXPECT_TRUE(debugged("VLUnbindUser: -2012"));
}

TEST_F(UnpairUser, SucceedsAlsoWhenTheUnlockKeyCannotBeErased) {
    service.pair("alice", blueSigning);
    keychain().failWith(-7);

    EXPECT_EQ(operation->unpairUser(blueSigning, "alice", &error), 0);

    EXPECT_EQ(error, std::nullopt);
    EXPECT_TRUE(noticed("unpairUser = -7, (user = alice, pubkey hash: B1)"));
}

TEST_F(UnpairUser, NeedsNoPlaceForAnError) {
    service.failWith(Service::kUnbindUser, -2012, notPaired);

    EXPECT_EQ(operation->unpairUser(blueSigning, "alice", nullptr), -2012);
}

TEST_F(UnpairUser, HandsOutTheErrorOfAServiceThatSucceededAllTheSame) {
    service.failWith(Service::kUnbindUser, 0, notPaired);

    EXPECT_EQ(operation->unpairUser(blueSigning, "bob", &error), 0);

    EXPECT_EQ(error, notPaired);
}

TEST_F(UnpairUser, WithoutAnyUserOrHashIsRefusedAndSendsNothing) {
    operation->setUserName(std::nullopt);

    EXPECT_EQ(operation->unpairUser(blueSigning, std::nullopt, &error), -1001);
    EXPECT_EQ(operation->unpairUser(std::nullopt, "alice", &error), -1001);

    EXPECT_EQ(service.requests[Service::kUnbindUser], 0);
    EXPECT_FALSE(unlockKeyTouched());
}

}  // namespace
}  // namespace vlm
