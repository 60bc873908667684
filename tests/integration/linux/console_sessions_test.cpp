#include <sstream>

#include "fake_console_sessions.h"
#include "tests/contracts/console_sessions_contract.h"
#include "tests/integration/linux/changed_machine.h"
#include "tests/integration/linux/probe.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

class FakeSessionsBackend : public contracts::FakeBackend<fakes::FakeConsoleSessions> {
public:
    void login(platform::UserId user, bool onConsole) { get().login(user, onConsole); }
    void stopSessionManager() { get().stopSessionManager(); }
};

// The real class in a process whose /run holds what a session manager would publish there.
class LogindBackend final : public platform::ConsoleSessions {
public:
    LogindBackend() {
        _machine.replace("/run", _run.path());
        std::filesystem::create_directories(_run.path() / "systemd/sessions");
    }

    std::optional<std::string> unavailable() { return ChangedMachine::unavailable(); }
    platform::ConsoleSessions& get() { return *this; }

    void login(platform::UserId user, bool onConsole) {
        publish(std::to_string(++_lastId), "UID=" + std::to_string(user) +
                                               "\nCLASS=user\nSTATE=active\nACTIVE=1\n" +
                                               (onConsole ? "SEAT=seat0\n" : ""));
    }

    void publish(const std::string& id, const std::string& content) {
        _run.write("systemd/sessions/" + id, content);
    }

    void stopSessionManager() { std::filesystem::remove_all(_run.path() / "systemd/sessions"); }

    std::optional<std::vector<platform::ConsoleSession>> sessions() const override {
        const auto ended = _machine.run(probe({"sessions"}));
        if (ended.status == kProbeAnswersNone) return std::nullopt;
        EXPECT_EQ(ended.status, 0) << ended.errors;
        std::vector<platform::ConsoleSession> sessions;
        std::istringstream lines(ended.output);
        platform::UserId user = 0;
        for (std::string where; lines >> user >> where;)
            sessions.push_back({where == "console", user});
        return sessions;
    }

private:
    TemporaryFolder _run;
    ChangedMachine _machine;
    int _lastId = 0;
};

class LogindConsoleSessionsTest : public contracts::ContractTest<LogindBackend> {};

TEST_F(LogindConsoleSessionsTest, PutsOnlyTheActiveUserOfTheFirstSeatOnTheConsole) {
    struct Row {
        const char* why;
        const char* content;
        bool onConsole;
    };
    const Row rows[] = {
        {"a user in front", "CLASS=user\nSEAT=seat0\nACTIVE=1\nSTATE=active\n", true},
        {"a user in the background", "CLASS=user\nSEAT=seat0\nACTIVE=0\nSTATE=online\n", false},
        {"a user who has left a program behind",
         "CLASS=user\nSEAT=seat0\nACTIVE=1\nSTATE=closing\n", false},
        {"a remote user", "CLASS=user\nACTIVE=1\nSTATE=active\nREMOTE=1\n", false},
        {"a user at another seat", "CLASS=user\nSEAT=seat1\nACTIVE=1\nSTATE=active\n", false},
        {"the login screen", "CLASS=greeter\nSEAT=seat0\nACTIVE=1\nSTATE=active\n", false},
        {"a lock screen", "CLASS=lock-screen\nSEAT=seat0\nACTIVE=1\nSTATE=active\n", false},
        {"a background session", "CLASS=background\nACTIVE=1\nSTATE=active\n", false},
        {"nothing known but the user", "", false},
    };
    for (const auto& row : rows) {
        backend().publish("1", std::string("UID=1000\n") + row.content);

        const auto sessions = backend().get().sessions();

        ASSERT_TRUE(sessions && sessions->size() == 1) << row.why;
        EXPECT_EQ(sessions->front().onConsole, row.onConsole) << row.why;
    }
}

TEST_F(LogindConsoleSessionsTest, OrdersTheSessionsThatTheKernelDoesNotCountAmongThemselves) {
    for (const auto* id : {"c10", "c2", "c1"})
        backend().publish(id, "UID=" + std::string(id).substr(1) + "\nCLASS=user\n");

    const auto sessions = backend().get().sessions();

    ASSERT_TRUE(sessions && sessions->size() == 3);
    EXPECT_EQ((*sessions)[0].userId, 1U);
    EXPECT_EQ((*sessions)[1].userId, 2U);
    EXPECT_EQ((*sessions)[2].userId, 10U);
}

TEST_F(LogindConsoleSessionsTest, LeavesOutWhatIsNoWholeSession) {
    backend().publish("1", "CLASS=user\nSEAT=seat0\nACTIVE=1\n");
    backend().publish("2", "");
    backend().publish("3", "UID=not-a-number\n");
    backend().publish(".#4abcdef", "UID=1004\n");
    backend().publish("5", "UID=1005\nCLASS=user\n");

    const auto sessions = backend().get().sessions();

    ASSERT_TRUE(sessions && sessions->size() == 1);
    EXPECT_EQ(sessions->front().userId, 1005U);
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, ConsoleSessionsContract, test::FakeSessionsBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Logind, ConsoleSessionsContract, test::LogindBackend);
}  // namespace vlm::contracts
