#include "util/bind_utils.h"

#include <array>
#include <thread>
#include <vector>

#include "platform_test.h"

namespace vlm {
namespace {

using fakes::PlatformTest;
using platform::kNobody;

class UserNames : public PlatformTest {};

TEST_F(UserNames, CurrentUserIsTheAccountOfTheRealUserId) {
    accounts().add("alice", 1000);
    accounts().add("root", 0);
    process().runSetUserId(/*real=*/1000, /*effective=*/0);

    EXPECT_EQ(BindUtils::currentUserName(), "alice");
}

TEST_F(UserNames, CurrentUserWithoutAnAccountHasNoName) {
    process().runAs(4711);

    EXPECT_EQ(BindUtils::currentUserName(), std::nullopt);
}

TEST_F(UserNames, CurrentUserWhoseAccountHasNoNameHasNoName) {
    accounts().add("", 1000);
    process().runAs(1000);

    EXPECT_EQ(BindUtils::currentUserName(), std::nullopt);
}

TEST_F(UserNames, UserIdOfAnAccountIsItsId) {
    accounts().add("alice", 1000);

    EXPECT_EQ(BindUtils::userIdForUserName("alice"), 1000U);
}

TEST_F(UserNames, UserIdOfANameThatHasNoAccountIsZero) {
    accounts().add("alice", 1000);

    EXPECT_EQ(BindUtils::userIdForUserName("nobody-here"), 0U);
}

TEST_F(UserNames, NameOfAUserIdIsTheAccountsName) {
    accounts().add("zo\xC3\xAB", 1001);

    EXPECT_EQ(BindUtils::userNameForUserId(1001), "zo\xC3\xAB");
}

TEST_F(UserNames, NameOfAnUnknownUserIdIsNone) {
    EXPECT_EQ(BindUtils::userNameForUserId(1001), std::nullopt);
}

TEST_F(UserNames, NameOfAnAccountWithoutANameIsNone) {
    accounts().add("", 1001);

    EXPECT_EQ(BindUtils::userNameForUserId(1001), std::nullopt);
}

TEST_F(UserNames, ProcessOwnerIsWhatTheProcessInformationSays) {
    accounts().add("alice", 1000);
    process().runAs(1000, "carol");

    EXPECT_EQ(BindUtils::processOwnerUserName(), "carol");
}

class CurrentLoggedInUserId : public PlatformTest {};

TEST_F(CurrentLoggedInUserId, IsTheFirstUserOnConsole) {
    sessions().login(1000, /*onConsole=*/false);
    sessions().login(1001, /*onConsole=*/true);
    sessions().login(1002, /*onConsole=*/true);

    EXPECT_EQ(BindUtils::currentLoggedInUserId(), 1001U);
}

TEST_F(CurrentLoggedInUserId, IsNobodyWhenOnlyTheSuperuserIsOnConsole) {
    sessions().login(0, /*onConsole=*/true);

    EXPECT_EQ(BindUtils::currentLoggedInUserId(), kNobody);
}

TEST_F(CurrentLoggedInUserId, IsNobodyWhenTheSuperuserIsTheFirstOnConsole) {
    sessions().login(0, /*onConsole=*/true);
    sessions().login(1000, /*onConsole=*/true);

    EXPECT_EQ(BindUtils::currentLoggedInUserId(), kNobody);
}

TEST_F(CurrentLoggedInUserId, IsNobodyWhenNobodyIsOnConsole) {
    sessions().login(1000, /*onConsole=*/false);

    EXPECT_EQ(BindUtils::currentLoggedInUserId(), kNobody);
}

TEST_F(CurrentLoggedInUserId, IsNobodyWithoutAnySession) {
    EXPECT_EQ(BindUtils::currentLoggedInUserId(), kNobody);
}

TEST_F(CurrentLoggedInUserId, IsNobodyWithoutASessionManager) {
    sessions().login(1000, /*onConsole=*/true);
    sessions().stopSessionManager();

    EXPECT_EQ(BindUtils::currentLoggedInUserId(), kNobody);
}

TEST_F(CurrentLoggedInUserId, IsAllOnesForNobody) { EXPECT_EQ(kNobody, 4294967295U); }

class BindUtilsLog : public PlatformTest {};

TEST_F(BindUtilsLog, WritesToTheFrameworksSubsystemInTheToolsCategory) {
    BindUtils::log().notice("hello {}", 7);

    const fakes::RecordingSystemLog::Line line{"org.vlm.token", "vlmbind",
                                               platform::LogLevel::Default, "hello 7"};
    EXPECT_EQ(log().lines(), std::vector{line});
}

TEST_F(BindUtilsLog, IsOneHandleForTheWholeProcessAlsoWhenThreadsAskForItTogether) {
    std::array<const platform::Log*, 4> handles = {};
    std::vector<std::thread> threads;
    for (auto& handle : handles) threads.emplace_back([&] { handle = &BindUtils::log(); });
    for (auto& thread : threads) thread.join();

    for (const auto* handle : handles) EXPECT_EQ(handle, &BindUtils::log());
}

}  // namespace
}  // namespace vlm
