// The module in a program that lets people in: PAM itself, a private bus, a real daemon, and a
// software card.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <security/_pam_types.h>
#include <signal.h>
#include <unistd.h>

#include <chrono>

#include "tests/integration/service/hints_machine.h"

namespace vlm::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

std::string authenticated(int result) { return "authenticate " + std::to_string(result) + "\n"; }

class PamVlmTest : public testing::Test {
protected:
    void SetUp() override {
        if (geteuid() != 0) GTEST_SKIP() << "only root can start a daemon that lets others in";
        writeService("");
    }

    // The module as the only one, with what it is told.
    void writeService(const std::string& options) {
        const std::string module = std::string(VLM_PAM_MODULE) +
                                   " bus=" + machine.systemBus().address() + " " + options + "\n";
        machine.folder().write("vlm-test", "auth required " + module + "account required " +
                                               module + "session required " + module +
                                               "password required " + module);
    }
    void pair(const std::string& account) {
        ASSERT_THAT(machine.call(machine.login({"str2=123456"})), StartsWith("res 0"));
        ASSERT_THAT(machine.call(machine.pair(account)), StartsWith("res 0"));
    }
    void startWithPairedCard() {
        machine.startDaemon();
        machine.insertCard();
        pair("daemon");
    }
    Ended probe(const std::vector<std::string>& words, std::optional<uid_t> user = std::nullopt) {
        std::vector<std::string> command{VLM_PAM_PROBE, machine.folder().path(), "vlm-test"};
        std::ranges::copy(words, std::back_inserter(command));
        return run(command, machine.options(user));
    }
    std::string said(const std::vector<std::string>& words) { return probe(words).output; }

    HintsMachine machine;
};

TEST_F(PamVlmTest, LogsInWithCardAndPin) {
    startWithPairedCard();

    const auto output = said({"user=daemon", "pin=123456", "account"});

    EXPECT_THAT(output, AllOf(HasSubstr("hidden: PIN of the card \"Card\": "),
                              HasSubstr(authenticated(PAM_SUCCESS)), HasSubstr("user daemon\n"),
                              HasSubstr("setcred 0\n"), HasSubstr("account 0\n")));
}

TEST_F(PamVlmTest, NamesTheUserWhomTheCardBelongsTo) {
    startWithPairedCard();

    EXPECT_THAT(said({"pin=123456"}), AllOf(HasSubstr(authenticated(PAM_SUCCESS)),
                                            HasSubstr("user daemon\n"), Not(HasSubstr("shown: "))));
}

TEST_F(PamVlmTest, LeavesThePasswordWayOpenWithoutACard) {
    machine.startDaemon();

    for (const std::string user : {"daemon", "root", "nobody-here"})
        EXPECT_THAT(said({"user=" + user}), StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL)));
    EXPECT_THAT(said({"name=daemon"}),
                AllOf(StartsWith("shown: "), HasSubstr(authenticated(PAM_AUTHINFO_UNAVAIL))));
}

TEST_F(PamVlmTest, KnowsNoCardOfAnother) {
    startWithPairedCard();

    EXPECT_THAT(said({"user=bin", "pin=123456"}), StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL)));
}

TEST_F(PamVlmTest, TriesAWrongPinOnce) {
    startWithPairedCard();

    const auto output = said({"user=daemon", "pin=000000", "pin=123456", "account"});

    EXPECT_THAT(output, AllOf(HasSubstr("error: Logging in with \"Alice Example\" of the card "
                                        "\"Card\": the card refused the PIN"),
                              HasSubstr(authenticated(PAM_AUTH_ERR))));
    EXPECT_THAT(output, Not(HasSubstr("account 0")));
    EXPECT_THAT(said({"user=daemon", "pin=123456"}), HasSubstr(authenticated(PAM_SUCCESS)));
}

TEST_F(PamVlmTest, GoesOnWithThePasswordForAnEmptyPin) {
    startWithPairedCard();

    EXPECT_THAT(said({"user=daemon", "pin="}), HasSubstr(authenticated(PAM_AUTHINFO_UNAVAIL)));
}

TEST_F(PamVlmTest, FailsWithAnApplicationThatDoesNotAsk) {
    startWithPairedCard();

    EXPECT_THAT(said({"user=daemon"}), HasSubstr(authenticated(PAM_CONV_ERR)));
}

TEST_F(PamVlmTest, LeavesThePasswordWayOpenWithoutAService) {
    EXPECT_THAT(said({"user=daemon"}), StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL)));
    machine.systemBus().stop();
    EXPECT_THAT(said({"user=daemon"}), StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL)));
}

TEST_F(PamVlmTest, WaitsForAServiceThatHangsNoLongerThanItIsTold) {
    startWithPairedCard();
    writeService("timeout=1");
    machine.daemon().signal(SIGSTOP);

    const auto begin = std::chrono::steady_clock::now();
    EXPECT_THAT(said({"user=daemon"}), StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL)));
    const auto took = std::chrono::steady_clock::now() - begin;

    machine.daemon().signal(SIGCONT);
    EXPECT_GE(took, std::chrono::milliseconds(900));
    EXPECT_LT(took, std::chrono::seconds(4));
}

TEST_F(PamVlmTest, LetsNobodyUseAnAccountThatIsNoLongerPaired) {
    startWithPairedCard();
    // After the login, before the account is looked at.
    machine.folder().write(
        "vlm-test", std::string("auth required ") + VLM_PAM_MODULE +
                        " bus=" + machine.systemBus().address() + "\nauth required pam_exec.so " +
                        machine.folder().path().string() + "/unpair\naccount required " +
                        VLM_PAM_MODULE + " bus=" + machine.systemBus().address() + "\n");
    std::string script =
        "#!/bin/sh\nexec env DBUS_SYSTEM_BUS_ADDRESS=" + machine.systemBus().address();
    for (const auto& word :
         machine.callCommand(kDaemon, {"op=3", "dat1=" + machine.hash(), "str1=daemon"}))
        script += " " + word;
    chmod(machine.folder().write("unpair", script + "\n").c_str(), 0755);

    const auto output = said({"user=daemon", "pin=123456", "account"});

    EXPECT_THAT(output, AllOf(HasSubstr(authenticated(PAM_SUCCESS)),
                              HasSubstr("error: The card is no longer paired"),
                              HasSubstr("account " + std::to_string(PAM_PERM_DENIED))));
}

TEST_F(PamVlmTest, SaysNothingOfAccountsAndSessionsThatNoCardHasLetIn) {
    machine.startDaemon();
    const std::string module =
        std::string(VLM_PAM_MODULE) + " bus=" + machine.systemBus().address() + "\n";
    machine.folder().write("vlm-test", "auth required pam_permit.so\naccount required " + module +
                                           "account required pam_permit.so\nsession required " +
                                           module);

    EXPECT_THAT(said({"user=daemon", "account", "session", "env=XDG_SESSION_ID=1"}),
                AllOf(HasSubstr("account 0\n"), HasSubstr("session 0\n")));
}

TEST_F(PamVlmTest, LeavesNothingBehindInItsProcess) {
    startWithPairedCard();
    const auto clean = AllOf(HasSubstr("more descriptors 0\n"), HasSubstr("threads 1\n"),
                             HasSubstr("signals as before\n"));

    EXPECT_THAT(said({"user=daemon", "pin=123456", "times=5"}), clean);
    EXPECT_THAT(said({"user=daemon", "pin=000000"}), clean);
    machine.stopDaemon();
    EXPECT_THAT(said({"user=daemon", "times=3"}), clean);
}

TEST_F(PamVlmTest, WorksWithoutStandardStreams) {
    startWithPairedCard();

    EXPECT_THAT(said({"user=daemon", "pin=123456", "closed", "account"}),
                AllOf(HasSubstr(authenticated(PAM_SUCCESS)), HasSubstr("account 0\n"),
                      HasSubstr("more descriptors 0\n")));
}

TEST_F(PamVlmTest, WorksOnASmallStack) {
    startWithPairedCard();

    EXPECT_THAT(said({"user=daemon", "pin=123456", "small-stack", "account"}),
                AllOf(HasSubstr(authenticated(PAM_SUCCESS)), HasSubstr("account 0\n")));
}

TEST_F(PamVlmTest, ServesNoUserFromNoSession) {
    startWithPairedCard();

    // A program of a user's own, outside every session.
    const auto ended = probe({"user=daemon", "pin=123456"}, kOtherUser);

    EXPECT_THAT(ended.output, StartsWith(authenticated(PAM_AUTHINFO_UNAVAIL))) << ended.errors;
}

}  // namespace
}  // namespace vlm::test
