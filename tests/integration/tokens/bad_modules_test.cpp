// Modules and workers that misbehave: the good cards are listed all the same.

#include <gmock/gmock.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <ostream>
#include <sstream>

#include "tests/integration/tokens/tokens_test.h"

namespace vlm::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;
using namespace std::chrono_literals;

class BadModulesTest : public TokensTest {
protected:
    BadModulesTest() { cards.add("good", {identity("p256", "Alice")}); }
};

TEST_F(BadModulesTest, OneThatCrashesCostsOneWarning) {
    configureModule("aborting");

    EXPECT_THAT(namesOf(list()), ElementsAre("good"));
    EXPECT_THAT(warnings(), ElementsAre(HasSubstr("the card module aborting crashed or ended")));

    EXPECT_THAT(namesOf(list()), ElementsAre("good"));
    EXPECT_THAT(warnings(), SizeIs(1)) << "the same trouble is said once";
}

TEST_F(BadModulesTest, OneThatHangsCostsItsTimeLimitAndOneWarning) {
    ASSERT_THAT(list(), SizeIs(1));
    dropTokens();
    configureModule("hanging");
    options.limits.list = options.limits.read = 2s;
    const auto start = std::chrono::steady_clock::now();

    const auto all = list();

    EXPECT_THAT(namesOf(all), ElementsAre("good"));
    EXPECT_LT(std::chrono::steady_clock::now() - start, 10s);
    EXPECT_THAT(warnings(),
                ElementsAre(HasSubstr("the card module hanging did not answer in time")));
}

TEST_F(BadModulesTest, OneThatIsSlowIsListedWithoutUntilItHasAnswered) {
    const auto gate = cards.folder() / "gate";
    options.environment.push_back("VLM_TEST_SLOW=" + gate.string());
    options.limits.list = 100ms;
    options.limits.read = 60s;
    configureOnly("slow");

    EXPECT_THAT(list(), IsEmpty());
    EXPECT_THAT(list(), IsEmpty()) << "whoever asks while it is read waits no longer either";
    EXPECT_EQ(tokens().lookAgain(), service::LookAgain::Soon);
    std::ofstream(gate) << "open";
    std::vector<Token> listed;
    while (listed.empty()) listed = list();

    EXPECT_THAT(namesOf(listed), ElementsAre("good"));
    EXPECT_NE(tokens().lookAgain(), service::LookAgain::Soon);
    EXPECT_THAT(warnings(), IsEmpty()) << "it was not ended";
}

TEST_F(BadModulesTest, OneThatLiesAboutSizesIsReadWithinBounds) {
    configureOnly("lying");

    const auto all = list();

    ASSERT_THAT(namesOf(all), ElementsAre("good"));
    EXPECT_THAT(namesOf(all[0].identities), ElementsAre("Alice"));
    EXPECT_THAT(warnings(), IsEmpty());
}

TEST_F(BadModulesTest, OneWithEndlessObjectsIsGivenUp) {
    configureOnly("endless");

    EXPECT_THAT(list(), IsEmpty());
    EXPECT_THAT(warnings(), ElementsAre(HasSubstr("the card \"good\" cannot be read")));
}

TEST_F(BadModulesTest, OneThatIsNoModuleIsAWarning) {
    cards.configureModule("text", "module: " + (cards.folder() / "softhsm2.conf").string() + "\n");

    EXPECT_THAT(namesOf(list()), ElementsAre("good"));
    EXPECT_THAT(warnings(),
                ElementsAre(HasSubstr("the card module text is of no use: it cannot be loaded")));
}

TEST_F(BadModulesTest, OneIsLoadedOnceThroughAllItsLinks) {
    std::filesystem::create_symlink(SoftCards::modulePath(), cards.folder() / "link.so");
    cards.configureModule("another", "module: link.so\n");

    EXPECT_THAT(namesOf(list()), ElementsAre("good"));
    EXPECT_THAT(warnings(), IsEmpty());
}

struct BadWorker {
    const char* why;
    const char* commands;
    const char* warning;
};

// What the test is listed as.
void PrintTo(const BadWorker& worker, std::ostream* stream) { *stream << worker.why; }

class BadWorkerTest : public BadModulesTest, public testing::WithParamInterface<BadWorker> {};

TEST_P(BadWorkerTest, IsEndedAndItsCardsAreNotListed) {
    useWorkerScript(GetParam().commands);
    options.limits.list = 10s;

    EXPECT_THAT(list(), IsEmpty()) << GetParam().why;

    EXPECT_THAT(warnings(), ElementsAre(HasSubstr(GetParam().warning))) << GetParam().why;
}

INSTANTIATE_TEST_SUITE_P(
    All, BadWorkerTest,
    testing::Values(
        BadWorker{"a program that ends", "exit 0", "crashed or ended"},
        BadWorker{"a length that is out of bounds",
                  "printf '\\377\\377\\377\\377' >&3; exec sleep 60", "too long"},
        BadWorker{"a frame that is no list", "printf '\\003\\000\\000\\000abc' >&3; exec sleep 60",
                  "makes no sense"},
        BadWorker{"half a frame", "printf '\\003\\000\\000\\000a' >&3", "crashed or ended"}));

TEST_F(BadModulesTest, AWorkerProgramThatIsMissingIsAWarning) {
    options.workerProgram = cards.folder() / "nothing";

    EXPECT_THAT(list(), IsEmpty());
    EXPECT_THAT(warnings(), ElementsAre(HasSubstr("crashed or ended")));
}

TEST_F(BadModulesTest, AWorkerHasItsSocketAndStandardFilesOnlyAndMayGainNothing) {
    const std::string report = cards.folder() / "report";
    useWorkerScript("exec 9>'" + report + "'\n" + R"(
        grep NoNewPrivs /proc/self/status >&9
        ulimit -c >&9
        files=$(readlink /proc/$$/fd/0 /proc/$$/fd/1)
        echo "$files" >&9
        exec ls /proc/self/fd >&9 9>&-
    )");
    const int inherited = dup(0);

    list();

    close(inherited);
    std::ostringstream text;
    text << std::ifstream(report).rdbuf();
    const std::string said = text.str();
    // The last file is the folder that ls itself reads.
    EXPECT_EQ(said, "NoNewPrivs:\t1\n0\n/dev/null\n/dev/null\n0\n1\n2\n3\n4\n");
}

TEST_F(BadModulesTest, AWorkerThatHangsDiesWithTheProcessThatStartedIt) {
    const std::filesystem::path hanging = cards.folder() / "hanging";
    options.environment.push_back("VLM_TEST_HANGING=" + hanging.string());
    configureOnly("hanging");
    prctl(PR_SET_CHILD_SUBREAPER, 1);  // what the child leaves behind comes to this process
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        sd_event* loop = nullptr;  // a loop does not survive a fork
        sd_event_new(&loop);
        service::WorkerTokens childTokens(loop, options);
        childTokens.list([](const std::vector<Token>&) {});
        while (sd_event_run(loop, UINT64_MAX) >= 0) continue;
        _exit(1);
    }
    while (!std::filesystem::exists(hanging) && waitpid(child, nullptr, WNOHANG) == 0) usleep(1000);
    ASSERT_TRUE(std::filesystem::exists(hanging));

    kill(child, SIGKILL);

    ASSERT_EQ(waitpid(child, nullptr, 0), child);
    int status = 0;
    EXPECT_GT(waitpid(-1, &status, 0), 0) << "the worker was not this process's to wait for";
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    prctl(PR_SET_CHILD_SUBREAPER, 0);
}

}  // namespace
}  // namespace vlm::test
