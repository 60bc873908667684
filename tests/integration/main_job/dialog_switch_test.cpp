// The switch of the pairing dialog from the shell: the user's own choice, the machine's, and the
// request to show the dialog now.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>
#include <iterator>

#include "machine.h"
#include "tests/integration/settings/machine_settings.h"

namespace vlm::test {

using ::testing::HasSubstr;
using ::testing::Not;

namespace {

constexpr const char* kEnabled = "SmartCard Pairing dialog is enabled.\n";
constexpr const char* kDisabled = "SmartCard Pairing dialog is disabled.\n";
constexpr uid_t kAlice = 65534;  // has an account everywhere, without which a bus lets nobody in
constexpr uid_t kBob = 65533;

bool canBeOthers() {
    return getuid() == 0 && run({"true"}, {{}, kAlice}).status && run({"true"}, {{}, kBob}).status;
}

// A user without privileges: the one who runs the test, or one that root becomes.
class DialogSwitch : public ::testing::Test {
protected:
    void SetUp() override {
        if (getuid() != 0) return;
        if (!canBeOthers()) GTEST_SKIP() << "this machine knows no user ids besides root's";
        alice = kAlice;
    }

    Ended vlmbind(std::vector<std::string> arguments) {
        return machine.vlmbind(std::move(arguments), alice, variables);
    }
    void expect(const std::vector<std::string>& arguments, const std::string& output,
                int status = 0) {
        const auto ended = vlmbind(arguments);
        EXPECT_EQ(ended.output, output) << ended.errors;
        EXPECT_THAT(ended.errors, Not(HasSubstr("vlmbind: ")));
        EXPECT_EQ(ended.status, status);
    }

    Machine machine;
    std::optional<uid_t> alice;
    std::map<std::string, std::optional<std::string>> variables;
};

TEST_F(DialogSwitch, IsOnForAUserWhoNeverDecided) {
    expect({"-s", "status"}, kEnabled);
    expect({"-v", "-s", "status"}, kEnabled);
}

TEST_F(DialogSwitch, StaysAsTheUserSetsIt) {
    expect({"-s", "disable"}, "");
    expect({"-s", "status"}, kDisabled);

    expect({"-s", "enable"}, "");
    expect({"-s", "status"}, kEnabled);
}

TEST_F(DialogSwitch, IsToldAboutWhenItIsSetVerbosely) {
    expect({"-v", "-s", "disable"}, kDisabled);
    expect({"-s", "enable", "-v"}, kEnabled);
}

TEST_F(DialogSwitch, IsKeptWhereTheEnvironmentWantsIt) {
    const auto home = machine.homeOf(alice);
    variables["XDG_CONFIG_HOME"] = home / "configuration";

    expect({"-s", "disable"}, "");

    expect({"-s", "status"}, kDisabled);
    EXPECT_TRUE(std::filesystem::exists(home / "configuration/vlm"));
    EXPECT_FALSE(std::filesystem::exists(home / ".config"));
    variables.clear();
    expect({"-s", "status"}, kEnabled);
}

TEST_F(DialogSwitch, IsRefusedForAWordThatIsNone) {
    expect({"-s", "off"}, "Invalid option argument specified.\n", 255);
    expect({"-s", "status"}, kEnabled);
}

TEST_F(DialogSwitch, IsNoCommandByItsVerbosityAlone) { expect({"-v"}, "", 255); }

TEST_F(DialogSwitch, ThatCannotBeKeptIsToldInTheLogAndNotByTheStatus) {
    const auto home = machine.homeOf(alice);
    std::ofstream(home / ".config") << "in the way of the folder";
    variables["VLM_LOG_TARGET"] = "stderr";

    const auto ended = vlmbind({"-v", "-s", "disable"});

    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(ended.output, kDisabled);
    EXPECT_THAT(ended.errors,
                HasSubstr("default vlmbind: set UserPairing allowed: 0, result: 0\n"));
    variables.clear();
    expect({"-s", "status"}, kEnabled);
}

TEST_F(DialogSwitch, IsInTheLogAsItIsSetAndRead) {
    variables = {{"VLM_LOG_TARGET", "stderr"}, {"VLM_LOG_LEVEL", "debug"}};

    const auto set = vlmbind({"-s", "disable"}).errors;
    const auto read = vlmbind({"-s", "status"}).errors;

    EXPECT_THAT(set, HasSubstr("debug vlmbind: entered command line pairing ui: disable\n"));
    EXPECT_THAT(set, HasSubstr("default vlmbind: set UserPairing allowed: 0, result: 1\n"));
    EXPECT_THAT(set, HasSubstr("debug vlmbind: exiting\n"));
    EXPECT_THAT(read, HasSubstr("debug vlmbind: allowed: 0\n"));
    EXPECT_THAT(read, HasSubstr("default vlmbind: SmartCard Pairing dialog is disabled.\n"));
}

class DialogSwitches : public ::testing::Test {
protected:
    void SetUp() override {
        if (getuid() != 0) GTEST_SKIP() << "only root can run the tool as other users";
        if (!canBeOthers()) GTEST_SKIP() << "this machine knows no user ids besides root's";
    }

    std::string status(uid_t user) { return machine.vlmbind({"-s", "status"}, user).output; }

    Machine machine;
};

TEST_F(DialogSwitches, OfTwoUsersAreTheirOwn) {
    EXPECT_EQ(machine.vlmbind({"-s", "disable"}, kAlice).status, 0);

    EXPECT_EQ(status(kAlice), kDisabled);
    EXPECT_EQ(status(kBob), kEnabled);

    EXPECT_EQ(machine.vlmbind({"-s", "disable"}, kBob).status, 0);
    EXPECT_EQ(machine.vlmbind({"-s", "enable"}, kAlice).status, 0);
    EXPECT_EQ(status(kAlice), kEnabled);
    EXPECT_EQ(status(kBob), kDisabled);
}

TEST_F(DialogSwitches, AreNotRoots) {
    for (const char* word : {"status", "enable", "disable"}) {
        const auto refused = machine.vlmbind({"-v", "-s", word});

        EXPECT_EQ(refused.status, 255);
        EXPECT_EQ(refused.output, "This operation must not be run with root privileges.\n");
    }
    EXPECT_TRUE(std::filesystem::is_empty(machine.homeOf(std::nullopt) / ".config/vlm"));
}

TEST_F(DialogSwitches, AreNotTheMachines) {
    if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
    MachineSettings settings;
    settings.set({{"UserPairing", false}});
    settings.force({{"UserPairing", false}});
    const std::string alice = std::to_string(kAlice);

    const auto ended = machine.run(settings.commandLine(
        {"setpriv", "--reuid=" + alice, "--regid=" + alice, "--clear-groups", "env",
         "HOME=" + machine.homeOf(kAlice).string(), machine.tool(), "-s", "status"}));

    EXPECT_EQ(ended.output, kEnabled) << ended.errors;
}

// A desktop session of the user with its bus.
class DialogRequest : public DialogSwitch {
protected:
    void SetUp() override {
        DialogSwitch::SetUp();
        if (IsSkipped()) return;
        PrivateBus::Options options;
        options.type = "session";
        options.includes = {folder.write(
            "users.conf",
            "<busconfig><policy context='default'><allow user='*'/></policy></busconfig>")};
        bus = std::make_unique<PrivateBus>(options);
        variables["DBUS_SESSION_BUS_ADDRESS"] = bus->address();
    }

    std::unique_ptr<Child> startReceiver() {
        auto receiver = std::make_unique<Child>(
            std::vector<std::string>{NOTIFICATION_RECEIVER, folder.path() / "received"},
            Child::Options{{{"DBUS_SESSION_BUS_ADDRESS", bus->address()}}, std::nullopt});
        EXPECT_TRUE(receiver->waitForOutput("ready\n")) << receiver->errors();
        return receiver;
    }

    TemporaryFolder folder;
    std::unique_ptr<PrivateBus> bus;
};

constexpr const char* kDelivered = "org.vlm.vlmbind.force-bind-ui\n";

TEST_F(DialogRequest, IsPostedOnTheSessionBusAndIsNoCommand) {
    const auto receiver = startReceiver();

    expect({"-f"}, "", 255);

    EXPECT_TRUE(receiver->waitForOutput(kDelivered));
}

TEST_F(DialogRequest, SucceedsTogetherWithACommand) {
    const auto receiver = startReceiver();

    expect({"-f", "-s", "status"}, kEnabled);

    EXPECT_TRUE(receiver->waitForOutput(kDelivered));
}

TEST_F(DialogRequest, GoesToTheBusInTheUsersRuntimeFolder) {
    const auto receiver = startReceiver();
    const auto runtime = machine.homeOf(alice) / "run";
    std::filesystem::create_directory(runtime);
    if (alice) {
        ASSERT_EQ(chown(runtime.c_str(), *alice, *alice), 0);
    }
    const std::string path = bus->address().substr(std::string("unix:path=").size());
    std::filesystem::create_symlink(path.substr(0, path.find(',')), runtime / "bus");
    variables = {{"XDG_RUNTIME_DIR", runtime}};

    expect({"-f"}, "", 255);

    EXPECT_TRUE(receiver->waitForOutput(kDelivered));
}

TEST_F(DialogRequest, ThatNobodyReceivesIsToldInTheLogAndNotByTheStatus) {
    variables["VLM_LOG_TARGET"] = "stderr";

    for (const auto& address : {bus->address(), std::string("unix:path=/no/such/bus")}) {
        variables["DBUS_SESSION_BUS_ADDRESS"] = address;

        const auto ended = vlmbind({"-f", "-s", "status"});

        EXPECT_EQ(ended.status, 0);
        EXPECT_EQ(ended.output, kEnabled);
        EXPECT_THAT(ended.errors, HasSubstr("error vlmbind: The notification "
                                            "org.vlm.vlmbind.force-bind-ui was not delivered. "));
    }
}

TEST_F(DialogRequest, IsNotPostedWhereTheMachineOrManagementHasTheDialogOff) {
    if (const auto reason = ChangedMachine::unavailable()) GTEST_SKIP() << *reason;
    const auto receiver = startReceiver();
    for (const bool managed : {false, true}) {
        const MachineSettings settings;
        settings.set({{"UserPairing", managed}});
        if (managed) settings.force({{"UserPairing", 0}});

        const auto ended =
            machine.run(settings.commandLine({machine.tool(), "-f"}), std::nullopt, variables);

        EXPECT_EQ(ended.output, "Pairing UI is disabled.\n");
        EXPECT_EQ(ended.status, 255);
    }
    EXPECT_FALSE(receiver->waitForOutput(kDelivered, std::chrono::milliseconds(50)));
}

TEST_F(DialogRequest, IsPostedWhateverTheUserWants) {
    const auto receiver = startReceiver();
    expect({"-s", "disable"}, "");

    expect({"-f"}, "", 255);

    EXPECT_TRUE(receiver->waitForOutput(kDelivered));
}

}  // namespace

}  // namespace vlm::test
