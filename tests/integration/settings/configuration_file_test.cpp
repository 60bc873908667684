// The configuration file of logins with smart cards, where it really lies.

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>
#include <sstream>

#include "machine_settings.h"

namespace vlm::test {

using platform::PropertyList;

namespace {

// What an answer may cost; a sanitizer takes its part.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int kMostMilliseconds = 1000;
constexpr int kMostMebibytes = 512;
#else
constexpr int kMostMilliseconds = 100;
constexpr int kMostMebibytes = 64;
#endif

struct Answer {
    int value = -1;
    std::string origin;
    int milliseconds = -1;
    int mebibytes = -1;
    std::string log;
};

// A machine that enforces cards for users who are paired, asked about nobody: the setting is 1
// exactly when the file maps attributes.
class ConfigurationFile : public ::testing::Test {
protected:
    void SetUp() override {
        if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
        machine.set({{"enforceSmartCard", true}, {"allowUnmappedUsers", true}});
    }

    void write(const std::string& content) const {
        std::ofstream(machine.configurationFile(), std::ios::binary) << content;
    }

    Answer enforced() const {
        Child::Options options;
        options.environment = {{"VLM_LOG_TARGET", "stderr"}, {"VLM_LOG_LEVEL", "debug"}};
        const auto ended =
            run(machine.commandLine({SETTINGS_PROBE, "enforceSmartCard", ""}), options);
        Answer answer;
        std::istringstream(ended.output) >> answer.value >> answer.origin >> answer.milliseconds >>
            answer.mebibytes;
        answer.log = ended.errors;
        return answer;
    }

    void expectUnreadable(const std::string& line) const {
        const auto answer = enforced();
        EXPECT_EQ(answer.value, 0) << answer.log;
        EXPECT_LT(answer.milliseconds, kMostMilliseconds);
        EXPECT_LT(answer.mebibytes, kMostMebibytes);
        if (!line.empty()) {
            EXPECT_NE(answer.log.find(line + "\n"), std::string::npos) << answer.log;
        }
    }

    MachineSettings machine;
};

TEST_F(ConfigurationFile, ThatIsNotThereMapsNothing) {
    expectUnreadable("debug ZEM: Failed to open configuration file (error 2)");
}

TEST_F(ConfigurationFile, MapsAttributesInWhicheverFormatItIs) {
    const PropertyList::Dictionary mapping{{"AttributeMapping", PropertyList::Dictionary{}}};
    const std::pair<const char*, std::string> rows[] = {
        {"binary", binary(mapping)},
        {"XML",
         "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\"><dict>"
         "<key>AttributeMapping</key><dict/></dict></plist>\n"},
        {"text", "{ AttributeMapping = { fields = (\"Common Name\"); }; }\n"},
    };
    for (const auto& [format, content] : rows) {
        write(content);

        EXPECT_EQ(enforced().value, 1) << format;
    }
}

TEST_F(ConfigurationFile, ThatMapsNoAttributesMapsNothing) {
    write(binary(PropertyList::Dictionary{{"Other", true}}));

    expectUnreadable("");
}

TEST_F(ConfigurationFile, OfTwoGibibytesIsAnsweredAtOnce) {
    write("bplist00");
    std::filesystem::resize_file(machine.configurationFile(), std::uintmax_t{2} << 30U);

    expectUnreadable("error ZEM: Failed to create data for plist");
}

TEST_F(ConfigurationFile, ThatIsAPipeIsAnsweredAtOnce) {
    ASSERT_EQ(mkfifo(machine.configurationFile().c_str(), 0644), 0);

    expectUnreadable("debug ZEM: Failed to open configuration file (error 22)");
}

TEST_F(ConfigurationFile, ThatIsADeviceIsAnsweredAtOnce) {
    std::filesystem::create_symlink("/dev/zero", machine.configurationFile());

    expectUnreadable("debug ZEM: Failed to open configuration file (error 22)");
}

TEST_F(ConfigurationFile, ThatIsMadeToBlowUpIsAnsweredAtOnce) {
    std::string nested;
    for (int i = 0; i < 100'000; ++i) nested += '(';
    std::string laughs = "<!DOCTYPE plist [<!ENTITY a0 \"ha\">";
    for (int i = 1; i < 30; ++i)
        laughs += "<!ENTITY a" + std::to_string(i) + " \"&a" + std::to_string(i - 1) + ";&a" +
                  std::to_string(i - 1) + ";\">";
    const std::pair<const char*, std::string> rows[] = {
        {"100,000 arrays within one another", nested},
        {"entities that double thirty times", laughs + "]><plist><dict><key>&a29;</key></dict>"},
        {"as much text as may be", "{ a = " + std::string((4U << 20U) - 10, 'a') + "; }"},
        {"as many values as may be", "( " + std::string(4U << 20U, ',')},
    };
    for (const auto& [why, content] : rows) {
        SCOPED_TRACE(why);
        write(content);
        expectUnreadable("");
    }
}

}  // namespace

}  // namespace vlm::test
