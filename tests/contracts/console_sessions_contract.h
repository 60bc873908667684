// What platform/console_sessions.h promises. Verbs: login(user, onConsole), stopSessionManager().

#pragma once

#include "platform/console_sessions.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class ConsoleSessionsContract : public ContractTest<Backend> {};

TYPED_TEST_SUITE_P(ConsoleSessionsContract);

TYPED_TEST_P(ConsoleSessionsContract, ListsNothingWhenNobodyIsLoggedIn) {
    const auto sessions = this->backend().get().sessions();

    ASSERT_TRUE(sessions);
    EXPECT_TRUE(sessions->empty());
}

TYPED_TEST_P(ConsoleSessionsContract, ListsSessionsInTheOrderTheyBegan) {
    constexpr platform::UserId kFirst = 1011;
    constexpr std::size_t kMany = 12;  // two digits of whatever counts them
    for (platform::UserId user = kFirst; user > kFirst - kMany; --user)
        this->backend().login(user, /*onConsole=*/false);

    const auto sessions = this->backend().get().sessions();

    ASSERT_TRUE(sessions);
    ASSERT_EQ(sessions->size(), kMany);
    for (platform::UserId index = 0; index < kMany; ++index)
        EXPECT_EQ((*sessions)[index].userId, kFirst - index);
}

TYPED_TEST_P(ConsoleSessionsContract, SaysWhoIsAtTheConsole) {
    this->backend().login(1000, /*onConsole=*/false);
    this->backend().login(1001, /*onConsole=*/true);

    const auto sessions = this->backend().get().sessions();

    ASSERT_TRUE(sessions);
    ASSERT_EQ(sessions->size(), 2U);
    EXPECT_FALSE((*sessions)[0].onConsole);
    EXPECT_TRUE((*sessions)[1].onConsole);
}

TYPED_TEST_P(ConsoleSessionsContract, ListsAllSessionsOfOneUser) {
    this->backend().login(1000, /*onConsole=*/true);
    this->backend().login(1000, /*onConsole=*/false);

    const auto sessions = this->backend().get().sessions();

    ASSERT_TRUE(sessions);
    ASSERT_EQ(sessions->size(), 2U);
    EXPECT_EQ((*sessions)[0].userId, 1000U);
    EXPECT_EQ((*sessions)[1].userId, 1000U);
}

TYPED_TEST_P(ConsoleSessionsContract, ListsTheSuperuserWithTheIdZero) {
    this->backend().login(0, /*onConsole=*/true);

    const auto sessions = this->backend().get().sessions();

    ASSERT_TRUE(sessions);
    ASSERT_EQ(sessions->size(), 1U);
    EXPECT_EQ((*sessions)[0].userId, 0U);
    EXPECT_TRUE((*sessions)[0].onConsole);
}

TYPED_TEST_P(ConsoleSessionsContract, TakesANewSnapshotWithEveryCall) {
    this->backend().login(1000, /*onConsole=*/false);
    const auto before = this->backend().get().sessions();

    this->backend().login(1001, /*onConsole=*/true);
    const auto after = this->backend().get().sessions();

    ASSERT_TRUE(before && after);
    EXPECT_EQ(before->size(), 1U);
    EXPECT_EQ(after->size(), 2U);
}

TYPED_TEST_P(ConsoleSessionsContract, HasNoListWithoutASessionManager) {
    this->backend().stopSessionManager();

    EXPECT_FALSE(this->backend().get().sessions());
}

REGISTER_TYPED_TEST_SUITE_P(ConsoleSessionsContract, ListsNothingWhenNobodyIsLoggedIn,
                            ListsSessionsInTheOrderTheyBegan, SaysWhoIsAtTheConsole,
                            ListsAllSessionsOfOneUser, ListsTheSuperuserWithTheIdZero,
                            TakesANewSnapshotWithEveryCall, HasNoListWithoutASessionManager);

}  // namespace vlm::contracts
