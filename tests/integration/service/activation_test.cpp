// What gets installed for the buses: they start the service when somebody asks, and let each talk
// to whom it may.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>
#include <sstream>

#include "hints_machine.h"
#include "platform/linux/session_bus_notifications.h"

namespace vlm::test {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

std::string content(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::string text;
    std::getline(file, text, '\0');
    return text;
}

// The installed activation file, for the program of the build tree and a bus without a systemd.
std::string activationFile(const std::string& name, const std::string& moreArguments) {
    std::istringstream installed(
        content(std::filesystem::path(VLM_ACTIVATION_FILES) / (name + ".service")));
    std::string adapted;
    for (std::string line; std::getline(installed, line);) {
        if (line.starts_with("SystemdService=")) continue;
        if (line.starts_with("Exec="))
            line = "Exec=" VLM_HINTS_SERVICE + line.substr(line.find(' ')) + moreArguments;
        adapted += line + "\n";
    }
    return adapted;
}

Ended isPaired(const PrivateBus& bus, const char* name) {
    return run({"busctl", "--address=" + bus.address(), "call", name, "/org/vlm/token/hints",
                "org.vlm.token.hints", "Exchange", "a{sv}", "2", "op", "t", "6", "str1", "s",
                "root"});
}

TEST(ActivationTest, StartsTheDaemonWhenSomebodyAsks) {
    TemporaryFolder folder;
    const auto database = (folder.path() / "state" / "hints.sqlite3").string();
    folder.write(std::string("services/") + kDaemon + ".service",
                 activationFile(kDaemon, " --database " + database));
    PrivateBus::Options options;
    options.serviceFolders = {folder.path() / "services"};
    const PrivateBus bus(options);

    const auto answer = isPaired(bus, kDaemon);

    if (geteuid() == 0)
        EXPECT_EQ(answer.output, "a{sv} 1 \"res\" x 0\n") << answer.errors;
    else
        EXPECT_THAT(answer.output, HasSubstr("\"res\" x -2001")) << answer.errors;
}

TEST(ActivationTest, StartsTheUsersInstanceWhenSomebodyAsks) {
    TemporaryFolder folder;
    folder.write(std::string("services/") + kAgent + ".service", activationFile(kAgent, ""));
    PrivateBus::Options options;
    options.type = "session";
    options.serviceFolders = {folder.path() / "services"};
    const PrivateBus bus(options);

    const auto answer = isPaired(bus, kAgent);

    EXPECT_THAT(answer.output, HasSubstr("\"res\" x -2002")) << answer.errors;
}

TEST(ActivationTest, NamesTheInstalledProgramAndItsUnit) {
    for (const auto* name : {kDaemon, kAgent}) {
        const auto file =
            content(std::filesystem::path(VLM_ACTIVATION_FILES) / (std::string(name) + ".service"));

        EXPECT_THAT(file, StartsWith("[D-BUS Service]\n"));
        EXPECT_THAT(file, HasSubstr(std::string("\nName=") + name + "\n"));
        EXPECT_THAT(file, testing::ContainsRegex("\nExec=/.*/vlm/vlmhintsd --(system|user)\n"));
        EXPECT_THAT(file, HasSubstr("\nSystemdService=vlmhintsd.service\n"));
    }
}

TEST(ActivationTest, NamesTheAgentAndItsUnit) {
    const std::string name = platform::kNotificationsService;
    const auto file = content(std::filesystem::path(VLM_ACTIVATION_FILES) / (name + ".service"));

    EXPECT_THAT(file, StartsWith("[D-BUS Service]\n"));
    EXPECT_THAT(file, HasSubstr("\nName=" + name + "\n"));
    // Without arguments it is the agent.
    EXPECT_THAT(file, testing::ContainsRegex("\nExec=/[^ ]*/bin/vlmbind\n"));
    EXPECT_THAT(file, HasSubstr("\nSystemdService=vlmbind.service\n"));
}

class PolicyTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0) GTEST_SKIP() << "only root can call as another user";
        machine.startDaemon();
    }
    // What the bus or the daemon says to a call without arguments.
    std::string call(const std::string& interface, const std::string& member, uid_t user) {
        return run({"busctl", "--address=" + machine.systemBus().address(), "call", kDaemon,
                    "/org/vlm/token/hints", interface, member},
                   machine.options(user))
            .errors;
    }

    HintsMachine machine;
};

TEST_F(PolicyTest, LetsEverybodyAskTheDaemon) {
    for (const auto& [interface, member] : std::vector<std::pair<std::string, std::string>>{
             {"org.vlm.token.hints", "Exchange"},
             {"org.vlm.token.hints.Prompters", "RegisterPrompter"},
             {"org.freedesktop.DBus.Introspectable", "Introspect"},
             {"org.freedesktop.DBus.Peer", "Ping"},
             {"org.freedesktop.DBus.Properties", "GetAll"}}) {
        EXPECT_THAT(call(interface, member, kNobodyUser), testing::Not(HasSubstr("Access denied")))
            << interface;
    }
}

TEST_F(PolicyTest, LetsRootOnlyAskAUsersInstanceForAPin) {
    EXPECT_THAT(call("org.vlm.token.hints.Prompter", "AskPin", kNobodyUser),
                HasSubstr("Access denied"));
    EXPECT_THAT(call("org.vlm.token.hints.Prompter", "AskPin", 0), HasSubstr("Unknown method"));
}

TEST_F(PolicyTest, LetsNothingElseThrough) {
    EXPECT_THAT(call("org.example.Other", "Method", kNobodyUser), HasSubstr("Access denied"));
}

}  // namespace
}  // namespace vlm::test
