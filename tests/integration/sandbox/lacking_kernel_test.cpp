// Kernels, and containers, that let a process confine itself in part only.

#include "probe_test.h"

namespace vlm::test {

namespace {

class LackingKernelTest : public ProbeTest {
protected:
    void takeAway(const char* mechanism) { probeOptions = {"--lacking", mechanism}; }
};

// Subsystem, category and level (1 is the default one) of a line.
constexpr const char* kLogLine = "org.vlm.token vlmbind 1 ";

void expectOneLine(const Report& report, const std::string& text) {
    ASSERT_EQ(report.log.size(), 1U) << report.errors;
    EXPECT_TRUE(report.log[0].starts_with(kLogLine)) << report.log[0];
    EXPECT_NE(report.log[0].find(text), std::string::npos) << report.log[0];
}

}  // namespace

TEST_F(LackingKernelTest, WithoutLandlockTheRestIsStillConfinedAndTheLogSaysWhatIsNot) {
    for (const char* lacking : {"landlock", "landlock-rights"}) {
        SCOPED_TRACE(lacking);
        takeAway(lacking);
        const auto file = probe({"read", fileIn(elsewhere())});

        EXPECT_EQ(file.result, 0);
        expectOneLine(file, "files outside the tool's folders");
        EXPECT_EQ(probe({"execve"}).result, EPERM);
        EXPECT_EQ(probe({"socket", "inet"}).result, EAFNOSUPPORT);
        EXPECT_EQ(probe({"chmod", fileIn(elsewhere())}).result, EPERM);
    }
}

TEST_F(LackingKernelTest, TheLogSaysWhyLandlockDoesNotConfine) {
    takeAway("landlock");
    expectOneLine(probe({"socket", "unix"}), "(Landlock: Function not implemented)");

    takeAway("landlock-rights");
    expectOneLine(probe({"socket", "unix"}), "(Landlock: Operation not permitted)");
}

TEST_F(LackingKernelTest, WithoutSeccompFilesAreStillConfinedAndTheLogSaysWhatIsNot) {
    if (!probe({"socket", "unix"}).log.empty())
        GTEST_SKIP() << "this kernel lacks Landlock or has an early version of it";
    takeAway("seccomp");

    const auto report = probe({"socket", "inet"});

    EXPECT_EQ(report.result, 0);
    expectOneLine(report, "system calls");
    EXPECT_EQ(probe({"read", fileIn(elsewhere())}).result, EACCES);
    EXPECT_EQ(probe({"execve"}).result, EACCES);
}

}  // namespace vlm::test
