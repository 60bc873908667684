// The doctor on the files of a machine in a folder: well as they are, and with one break at a time.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>

#include "control_machine.h"

namespace vlm::test {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

class Doctor : public ::testing::Test {
protected:
    Doctor() {
        for (const auto* file : {
                 "usr/sbin/pcscd",
                 "usr/lib/x86_64-linux-gnu/pkcs11/opensc-pkcs11.so",
                 "usr/share/dbus-1/system-services/org.vlm.token.hints.daemon.service",
                 "usr/share/dbus-1/services/org.vlm.token.hints.agent.service",
                 "usr/share/dbus-1/system.d/org.vlm.token.hints.daemon.conf",
                 "usr/lib/systemd/system/vlmhintsd.service",
                 "etc/systemd/user/graphical-session.target.wants/vlmhintsd.service",
                 "usr/share/polkit-1/actions/org.vlm.vlmbind.policy",
                 "usr/share/vlm/sandbox/org.vlm.vlmbind.profile",
                 "usr/share/vlm/ui/BindDialog.ui",
                 "usr/lib/x86_64-linux-gnu/vlm/vlm_qt_windowing.so",
                 "usr/lib/x86_64-linux-gnu/security/pam_vlm.so",
             })
            disk.write(file, "");
        disk.write("usr/share/p11-kit/modules/opensc.module",
                   "module: " +
                       (disk.path() / "usr/lib/x86_64-linux-gnu/pkcs11/opensc-pkcs11.so").string() +
                       "\n");
        disk.write("etc/pam.d/login", "auth sufficient pam_vlm.so\nauth required pam_unix.so\n");
    }

    Ended examine(std::vector<std::string> more = {}) {
        std::vector<std::string> words{"doctor", "--root", disk.path()};
        words.insert(words.end(), more.begin(), more.end());
        return machine.vlmctl(words);
    }

    ControlMachine machine;
    TemporaryFolder disk;
};

TEST_F(Doctor, FindsAWholeMachineWell) {
    const auto ended = examine();

    EXPECT_EQ(ended.status, 0) << ended.output;
    EXPECT_THAT(ended.output, Not(HasSubstr("problem")));
    EXPECT_THAT(ended.output, Not(HasSubstr("warning")));
    EXPECT_THAT(ended.output, HasSubstr("ok       modules: opensc\n"));
}

struct Break {
    const char* missing;
    const char* line;
};

TEST_F(Doctor, FindsEachBreakByName) {
    const Break breaks[] = {
        {"usr/sbin/pcscd", "problem  pcscd: "},
        {"usr/share/p11-kit/modules/opensc.module", "problem  modules: "},
        {"usr/lib/x86_64-linux-gnu/pkcs11/opensc-pkcs11.so", "problem  modules: "},
        {"usr/share/dbus-1/system-services", "problem  daemon-activation: "},
        {"usr/share/dbus-1/services", "problem  user-activation: "},
        {"usr/share/dbus-1/system.d", "problem  bus-policy: "},
        {"usr/lib/systemd/system/vlmhintsd.service", "problem  daemon-unit: "},
        {"etc/systemd/user", "warning  user-service: "},
        {"usr/share/polkit-1", "problem  polkit: "},
        {"usr/share/vlm/sandbox", "problem  sandbox: "},
        {"usr/share/vlm/ui", "problem  window-layout: "},
        {"usr/lib/x86_64-linux-gnu/vlm", "problem  window: "},
        {"usr/lib/x86_64-linux-gnu/security", "problem  pam-module: "},
        {"etc/pam.d/login", "problem  logins: "},
    };
    for (const auto& [missing, line] : breaks) {
        const auto away = disk.path() / "away";
        std::filesystem::rename(disk.path() / missing, away);

        const auto ended = examine();

        std::filesystem::rename(away, disk.path() / missing);
        EXPECT_THAT(ended.output, HasSubstr(line)) << missing;
        EXPECT_EQ(ended.status, std::string(line).starts_with("problem") ? 1 : 0) << missing;
    }
}

TEST_F(Doctor, IsQuickWhereNothingIsInstalled) {
    const auto begin = std::chrono::steady_clock::now();

    const auto files = machine.vlmctl({"doctor", "--root", "/nonexistent"});
    const auto here = machine.vlmctl({"doctor"});

    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(4));
    EXPECT_EQ(files.status, 1);
    EXPECT_EQ(here.status, 1) << here.output;
    EXPECT_THAT(here.output, HasSubstr("problem  daemon: it does not answer\n         "));
}

TEST_F(Doctor, SpeaksToProgramsToo) {
    std::filesystem::remove(disk.path() / "usr/sbin/pcscd");

    const auto ended = examine({"--json"});

    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.output, HasSubstr("      \"check\": \"pcscd\",\n"
                                        "      \"verdict\": \"problem\",\n"));
    EXPECT_THAT(ended.output, HasSubstr("\"remedy\": \"Install pcscd.\""));
    EXPECT_THAT(ended.output, HasSubstr("\"remedy\": null"));
}

TEST_F(Doctor, AnswersToAServiceThatRuns) {
    machine.machine.startService();

    const auto ended = machine.vlmctl({"doctor"});

    EXPECT_THAT(ended.output, HasSubstr("ok       daemon: it answers\n"));
}

}  // namespace
}  // namespace vlm::test
