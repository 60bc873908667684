#include <gmock/gmock.h>

#include "platform/linux/file_descriptor.h"
#include "recording_system_log.h"
#include "tests/contracts/system_log_contract.h"
#include "tests/integration/linux/changed_machine.h"
#include "tests/integration/linux/log_socket.h"
#include "tests/integration/linux/probe.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

using platform::LogLevel;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

using Environment = std::map<std::string, std::optional<std::string>>;

Child::Options with(Environment environment) {
    for (const auto* name : {"VLM_LOG_TARGET", "VLM_LOG_LEVEL"})
        environment.try_emplace(name, std::nullopt);
    return {.environment = environment, .user = {}};
}

std::vector<std::string> logging(LogLevel level, const std::string& text) {
    return probe(
        {"log", "org.example", "pairing", std::to_string(static_cast<int>(level)), text, ""});
}

// The text of all four levels on standard error.
std::string errorsOf(const Environment& environment) {
    std::string errors;
    for (const auto level : {LogLevel::Error, LogLevel::Default, LogLevel::Info, LogLevel::Debug})
        errors += run(logging(level, "text"), with(environment)).errors;
    return errors;
}

class FakeLogBackend : public contracts::FakeBackend<fakes::RecordingSystemLog> {
public:
    std::vector<contracts::LogLine> delivered() {
        std::vector<contracts::LogLine> lines;
        for (const auto& line : get().lines())
            lines.push_back({line.subsystem, line.category, line.level, line.text, line.activity});
        return lines;
    }
};

// The real class in processes whose journal is the test's socket.
class JournalBackend final : public platform::SystemLog {
public:
    JournalBackend() { _machine.replace("/run", _run.path()); }

    std::optional<std::string> unavailable() { return ChangedMachine::unavailable(); }
    platform::SystemLog& get() { return *this; }

    bool collects(LogLevel level) const override {
        const auto question = probe({"collects", std::to_string(static_cast<int>(level))});
        return _machine.run(question, with({})).status == 0;
    }

    void write(const platform::LogRecord& record) override {
        const auto ended =
            _machine.run(probe({"log", std::string(record.subsystem), std::string(record.category),
                                std::to_string(static_cast<int>(record.level)),
                                std::string(record.text), std::string(record.activity)}),
                         with({}));
        EXPECT_EQ(ended.status, 0) << ended.errors;
        EXPECT_EQ(ended.errors, "");
    }

    std::vector<contracts::LogLine> delivered() {
        std::vector<contracts::LogLine> lines;
        for (auto& fields : records()) {
            constexpr std::array kPriorities{"3", "5", "6", "7"};
            const auto* level = std::ranges::find(kPriorities, fields["PRIORITY"]);
            lines.push_back({fields["SUBSYSTEM"], fields["CATEGORY"],
                             static_cast<LogLevel>(level - kPriorities.begin()), fields["MESSAGE"],
                             fields["ACTIVITY"]});
        }
        return lines;
    }

    std::vector<JournalFields> records() {
        std::vector<JournalFields> records;
        for (const auto& packet : _journal.take()) records.push_back(journalFields(packet));
        return records;
    }

private:
    TemporaryFolder _run;
    LogSocket _journal{_run.path() / "systemd/journal/socket"};
    ChangedMachine _machine;
};

class JournalSystemLogTest : public contracts::ContractTest<JournalBackend> {};

TEST_F(JournalSystemLogTest, NamesTheProgramAndNoPlaceInItsSource) {
    backend().get().write({"org.example", "pairing", LogLevel::Error, "text"});

    EXPECT_THAT(backend().records(),
                ElementsAre(JournalFields{{"MESSAGE", "text"},
                                          {"PRIORITY", "3"},
                                          {"SUBSYSTEM", "org.example"},
                                          {"CATEGORY", "pairing"},
                                          {"SYSLOG_IDENTIFIER", "platform_probe"}}));
}

TEST_F(JournalSystemLogTest, TakesOneLineFeedOffTheEnd) {
    backend().get().write({"s", "c", LogLevel::Error, "text\n"});

    EXPECT_EQ(backend().delivered().at(0).text, "text");
}

TEST_F(JournalSystemLogTest, CollectsEverythingButDebugLinesUnlessAsked) {
    EXPECT_TRUE(backend().get().collects(LogLevel::Info));
    EXPECT_FALSE(backend().get().collects(LogLevel::Debug));
}

TEST(StandardErrorLogTest, WritesDownToTheLevelAskedFor) {
    struct Row {
        const char* level;
        const char* expected;
    };
    const Row rows[] = {
        {"error", "error pairing: text\n"},
        {"default", "error pairing: text\ndefault pairing: text\n"},
        {"info", "error pairing: text\ndefault pairing: text\ninfo pairing: text\n"},
        {"debug",
         "error pairing: text\ndefault pairing: text\ninfo pairing: text\ndebug pairing: text\n"},
        {"nonsense", "error pairing: text\ndefault pairing: text\ninfo pairing: text\n"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(errorsOf({{"VLM_LOG_TARGET", "stderr"}, {"VLM_LOG_LEVEL", row.level}}),
                  row.expected)
            << row.level;
}

TEST(StandardErrorLogTest, EscapesWhatWouldBreakTheLine) {
    const auto ended =
        run(logging(LogLevel::Error, "one\ntwo\x1b[31m\n"), with({{"VLM_LOG_TARGET", "stderr"}}));

    EXPECT_EQ(ended.errors, "error pairing: one\\ntwo\\x1b[31m\n");
}

TEST(StandardErrorLogTest, StaysSilentWhenNoLogIsWanted) {
    EXPECT_EQ(errorsOf({{"VLM_LOG_TARGET", "none"}, {"VLM_LOG_LEVEL", "debug"}}), "");
    EXPECT_EQ(run(probe({"collects", "0"}), with({{"VLM_LOG_TARGET", "none"}})).status,
              kProbeAnswersNone);
}

// A machine without a journal, where a test may listen to syslog.
class NoJournalTest : public ::testing::Test {
protected:
    void SetUp() override {
        if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
        machine.replace("/run", run.path());
    }

    TemporaryFolder run;
    ChangedMachine machine;
};

TEST_F(NoJournalTest, ShowsOnlyErrorsOnATerminal) {
    std::string shown;
    for (const auto level : {LogLevel::Error, LogLevel::Default, LogLevel::Info}) {
        std::string command;
        for (const auto& word : machine.commandLine(logging(level, "text")))
            command += " '" + word + "'";
        // The terminal that script makes is the program's standard error.
        const auto ended = test::run({"script", "-qec", command, "/dev/null"}, with({}));
        ASSERT_EQ(ended.status, 0) << ended.output << ended.errors;
        shown += ended.output;
    }

    EXPECT_EQ(shown, "error pairing: text\r\n");
}

TEST_F(NoJournalTest, WritesToSyslogWhereNobodyWatches) {
    const TemporaryFolder devices;
    LogSocket syslog(devices.path() / "log");
    machine.replace("/dev", devices.path());

    for (const auto level : {LogLevel::Error, LogLevel::Default, LogLevel::Debug}) {
        const auto ended = machine.run(logging(level, "one\ntwo"), with({}));
        EXPECT_EQ(ended.errors, "");
    }

    // 8 is the facility of user programs.
    EXPECT_THAT(syslog.take(), ElementsAre(::testing::AllOf(::testing::StartsWith("<11>"),
                                                            HasSubstr(" platform_probe"),
                                                            EndsWith(": pairing: one\\ntwo")),
                                           ::testing::StartsWith("<13>")));
}

TEST_F(NoJournalTest, LosesLinesForAJournalThatWasAskedFor) {
    const auto ended =
        machine.run(logging(LogLevel::Error, "text"), with({{"VLM_LOG_TARGET", "journal"}}));

    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(ended.errors, "");
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, SystemLogContract, test::FakeLogBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Journal, SystemLogContract, test::JournalBackend);
}  // namespace vlm::contracts
