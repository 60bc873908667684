// What needs no session. The sessions themselves are in tests/lab/scenarios/right.py.

#include "services/hints/logind_caller_sessions.h"

#include <gmock/gmock.h>

#include <optional>

#include "bus_test.h"

namespace vlm::service {
namespace {

class LogindCallerSessionsTest : public BusTest {
protected:
    std::optional<SessionState> stateFor(const Caller& caller) {
        LogindCallerSessions sessions(_connection.get());
        std::optional<SessionState> state;
        const auto question = sessions.ask(caller, [&](SessionState answer) { state = answer; });
        EXPECT_FALSE(state) << "answered before the call returned";
        runUntil([&] { return state.has_value(); });
        return state;
    }

private:
    platform::SdBus _connection = connect();
};

TEST_F(LogindCallerSessionsTest, KnowNoneOfAProcessThatTheBusDoesNotKnow) {
    EXPECT_EQ(stateFor({1000, 0, ":1.1"}), SessionState::None);
}

TEST_F(LogindCallerSessionsTest, KnowNoneOfAProcessThatIsGone) {
    EXPECT_EQ(stateFor({1000, 0x3fffff, ":1.1"}), SessionState::None);
}

TEST_F(LogindCallerSessionsTest, KnowNoneThatIsAnotherUsers) {
    // Whoever runs this test is not this user.
    EXPECT_EQ(stateFor({4711, getpid(), ":1.1"}), SessionState::None);
}

}  // namespace
}  // namespace vlm::service
