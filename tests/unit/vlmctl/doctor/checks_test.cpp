#include "services/vlmctl/doctor/checks.h"

#include "doctor_fixture.h"

namespace vlm::control::doctor {
namespace {

using testing::IsEmpty;

class DoctorChecks : public DoctorTest {
protected:
    Finding aboutReaders(const std::string& check) { return about(checkReaders(patient), check); }
    Finding aboutSettings(const std::string& check) { return about(checkSettings(patient), check); }
};

TEST_F(DoctorChecks, FindAClockThatWasReset) {
    EXPECT_THAT(about(checkClock(patient), "clock"), IsWell());

    patient.now = 0;
    EXPECT_THAT(about(checkClock(patient), "clock"), IsAProblem("before this program was made"));
}

TEST_F(DoctorChecks, FindAPcscdThatIsMissingStoppedOrSilent) {
    patient.answers->readers.reset();
    EXPECT_THAT(aboutReaders("pcscd"), IsAProblem("is not installed"));

    folder.write("usr/sbin/pcscd", "");
    EXPECT_THAT(aboutReaders("pcscd"), IsAProblem("is not running"));

    folder.write("run/pcscd/pcscd.comm", "");
    EXPECT_THAT(aboutReaders("pcscd"), IsAProblem("does not serve this user"));

    patient.answers->readers.emplace();
    EXPECT_THAT(aboutReaders("pcscd"), IsWell());
}

TEST_F(DoctorChecks, FindMissingReadersAndCards) {
    EXPECT_THAT(aboutReaders("readers"), IsWell());
    EXPECT_THAT(aboutReaders("card"), IsWell());

    patient.answers->readers->clear();
    patient.answers->cards->clear();

    EXPECT_THAT(aboutReaders("readers"), Warns("no reader"));
    EXPECT_THAT(aboutReaders("card"), Warns("no card"));
}

TEST_F(DoctorChecks, FindACardThatIsGoodForNoLogin) {
    patient.answers->cards = {{Card{"A\nB", 2, 0}}};
    EXPECT_THAT(aboutReaders("certificate"), Warns("none on \"A\ufffdB\" is in its dates"));

    patient.answers->cards = {{Card{"Empty", 0, 0}}};
    EXPECT_THAT(aboutReaders("certificate"), Warns("\"Empty\" holds none"));
}

TEST_F(DoctorChecks, FindADaemonThatDoesNotAnswer) {
    EXPECT_THAT(about(checkService(patient), "daemon"), IsWell());

    patient.answers->pairings.reset();

    EXPECT_THAT(about(checkService(patient), "daemon"), IsAProblem("does not answer"));
}

TEST_F(DoctorChecks, FindASessionWithoutAKeyring) {
    patient.runtimeFolder = folder.path() / "runtime";
    EXPECT_THAT(about(checkKeyring(patient), "keyring"), Warns("no keyring runs"));

    folder.write("runtime/keyring/control", "");
    EXPECT_THAT(about(checkKeyring(patient), "keyring"), IsWell());

    patient.isRoot = true;
    EXPECT_THAT(checkKeyring(patient), IsEmpty()) << "root has no such session";
}

TEST_F(DoctorChecks, FindSettingsThatLockEverybodyOut) {
    EXPECT_THAT(aboutSettings("enforcement"), IsWell());

    putOnMachine("enforceSmartCard", true);
    EXPECT_THAT(aboutSettings("enforcement"), IsWell());
    putOnMachine("allowSmartCard", false);

    EXPECT_THAT(aboutSettings("enforcement"), IsAProblem("nobody can log in"));
    EXPECT_THAT(aboutSettings("cards"), Warns("cards are not used"));
}

TEST_F(DoctorChecks, FindAnAccountThatWouldBeLockedOut) {
    putOnMachine("enforceSmartCard", true);
    patient.answers->pairings = 0;
    EXPECT_THAT(aboutSettings("enforcement"), IsAProblem("alice is paired with none"));

    putOnMachine("allowUnmappedUsers", true);
    EXPECT_THAT(aboutSettings("enforcement"), IsWell());

    putOnMachine("allowUnmappedUsers", false);
    patient.answers->pairings.reset();
    EXPECT_THAT(aboutSettings("enforcement"), IsWell()) << "nobody knows";
}

TEST_F(DoctorChecks, LeaveOutWhatOnlyARunningMachineTells) {
    patient.answers.reset();

    EXPECT_THAT(checkKeyring(patient), IsEmpty());
    EXPECT_THAT(checkSettings(patient), IsEmpty());
    EXPECT_THAT(checkTrust(patient), IsEmpty());
    for (const auto& finding : checkReaders(patient)) EXPECT_EQ(finding.check, "pcscd");
}

}  // namespace
}  // namespace vlm::control::doctor
