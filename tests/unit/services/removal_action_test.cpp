#include "services/hints/removal_action.h"

#include <gmock/gmock.h>

#include "fake_user_sessions.h"
#include "platform_test.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class RemovalActionTest : public fakes::PlatformTest {
protected:
    RemovalActionTest() {
        sessions.open = {"1", "2", "3"};
        cards.record("1", "pkcs11:token=a");
        cards.record("2", "pkcs11:token=b");
        cards.record("9", "pkcs11:token=a");  // of another user
    }

    std::int32_t setting = 0;
    test::TemporaryFolder folder;
    SessionCards cards{folder.path() / "sessions"};
    fakes::FakeUserSessions sessions;
    RemovalAction action{{cards, sessions, [this] { return setting; }}};
};

TEST_F(RemovalActionTest, LocksTheSessionOfTheCard) {
    setting = 1;

    action.cardRemoved("pkcs11:token=a");

    EXPECT_THAT(sessions.locked, ElementsAre("1"));
    EXPECT_THAT(sessions.ended, IsEmpty());
}

TEST_F(RemovalActionTest, LogsTheSessionOfTheCardOut) {
    setting = 2;

    action.cardRemoved("pkcs11:token=b");

    EXPECT_THAT(sessions.ended, ElementsAre("2"));
    EXPECT_THAT(sessions.locked, IsEmpty());
}

TEST_F(RemovalActionTest, LeavesSessionsAloneThatWereLoggedInOtherwise) {
    setting = 2;

    action.cardRemoved("pkcs11:token=c");

    EXPECT_THAT(sessions.ended, IsEmpty());
}

TEST_F(RemovalActionTest, DoesNothingUnlessTheSettingAsksForIt) {
    for (const std::int32_t each : {0, -1, 3}) {
        setting = each;
        action.cardRemoved("pkcs11:token=a");
    }

    EXPECT_THAT(sessions.locked, IsEmpty());
    EXPECT_THAT(sessions.ended, IsEmpty());
}

}  // namespace
}  // namespace vlm::service
