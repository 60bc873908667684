#include "platform/system_log.h"

#include <thread>

#include "platform_test.h"

namespace vlm::platform {
namespace {

constexpr Log kLog("org.example", "cards");

class LogTest : public fakes::PlatformTest {};

// A log whose debug lines nobody reads.
class QuietLog final : public SystemLog {
public:
    bool collects(LogLevel level) const override { return level != LogLevel::Debug; }
    void write(const LogRecord& record) override { texts.emplace_back(record.text); }

    std::vector<std::string> texts;
};

TEST_F(LogTest, WritesWithItsSubsystemAndCategoryAtTheLevelAsked) {
    kLog.error("one");
    kLog.notice("two");
    kLog.info("three");
    kLog.debug("four");

    using Line = fakes::RecordingSystemLog::Line;
    EXPECT_EQ(log().lines(),
              (std::vector<Line>{{"org.example", "cards", LogLevel::Error, "one"},
                                 {"org.example", "cards", LogLevel::Default, "two"},
                                 {"org.example", "cards", LogLevel::Info, "three"},
                                 {"org.example", "cards", LogLevel::Debug, "four"}}));
}

TEST_F(LogTest, FillsValuesIntoItsPattern) {
    kLog.notice("{} cards for {}", 2, "alice");

    EXPECT_TRUE(log().has(LogLevel::Default, "2 cards for alice"));
}

// What the lines so far belong to.
class LogActivityTest : public LogTest {
protected:
    std::vector<std::string> activities() {
        std::vector<std::string> names;
        for (const auto& line : log().lines()) names.push_back(line.activity);
        return names;
    }
};

TEST_F(LogActivityTest, NamesTheLinesOfItsLife) {
    kLog.notice("before");
    {
        const LogActivity activity("clicked");
        kLog.notice("during");
    }
    kLog.notice("after");

    EXPECT_EQ(activities(), (std::vector<std::string>{"", "clicked", ""}));
}

TEST_F(LogActivityTest, GivesWayToAnInnerOne) {
    const LogActivity outer("new token");
    {
        const LogActivity inner("clicked");
        kLog.notice("inner");
    }
    kLog.notice("outer");

    EXPECT_EQ(activities(), (std::vector<std::string>{"clicked", "new token"}));
}

TEST_F(LogActivityTest, IsItsThreadsAlone) {
    const LogActivity activity("clicked");

    std::thread([] { kLog.notice("elsewhere"); }).join();

    EXPECT_EQ(activities(), std::vector<std::string>{""});
}

class LogWithoutDebugReaders : public fakes::PlatformTest {
protected:
    LogWithoutDebugReaders() { fakePlatform().systemLog = &_quiet; }
    QuietLog _quiet;
};

TEST_F(LogWithoutDebugReaders, DeliversOnlyWhatSomebodyCollects) {
    kLog.debug("dropped");
    kLog.info("kept");

    EXPECT_EQ(_quiet.texts, std::vector<std::string>{"kept"});
}

}  // namespace
}  // namespace vlm::platform
