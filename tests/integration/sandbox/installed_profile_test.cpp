// How a program finds its profile, and what a bad one does.

#include <sys/stat.h>

#include "probe_test.h"

namespace vlm::test {

namespace {

// A program that is installed somewhere else, with a profile of its own.
class InstalledProfileTest : public ProbeTest {
protected:
    InstalledProfileTest() {
        std::filesystem::create_directories(installed() / "bin");
        const auto copy = installed() / "bin/sandbox_probe";
        std::filesystem::copy_file(program, copy);
        program = copy;
        probeOptions = {"--profile", "test"};
    }

    std::filesystem::path installed() const { return folder().path() / "installed"; }
    std::filesystem::path profilePath() const {
        return installed() / "share/vlm/sandbox/test.profile";
    }

    void install(const std::string& profile) const {
        folder().write("installed/share/vlm/sandbox/test.profile", profile);
    }
};

}  // namespace

TEST_F(InstalledProfileTest, IsFoundBesideTheProgram) {
    install("read /\nwrite $(INSTALL_DIR)/own\nsocket unix\n");
    std::filesystem::create_directories(installed() / "own");

    EXPECT_EQ(probe({"create", installed() / "own/file"}).result, 0);
    EXPECT_EQ(probe({"list", "/"}).result, 0);
    EXPECT_EQ(probe({"socket", "unix"}).result, 0);
}

TEST_F(InstalledProfileTest, AnEmptyOneAllowsNothing) {
    install("# nothing\n");

    EXPECT_EQ(probe({"socket", "unix"}).result, EAFNOSUPPORT);
    EXPECT_EQ(probe({"execve"}).result, EPERM);
}

TEST_F(InstalledProfileTest, IsNotLookedForAnywhereElse) {
    install("read /\n");

    probeOptions = {"--profile", "other"};
    const auto report = probe({"list", "/"});

    EXPECT_EQ(report.refusal, "-1 " + (installed() / "share/vlm/sandbox/other.profile").string() +
                                  ": No such file or directory");
    EXPECT_FALSE(report.result);
}

TEST_F(InstalledProfileTest, ANameIsNoPath) {
    install("read /\n");

    for (const char* name : {"../sandbox/test", "/etc/passwd", ""}) {
        probeOptions = {"--profile", name};
        EXPECT_EQ(probe({"list", "/"}).refusal,
                  "-1 \"" + std::string(name) + "\" cannot name a profile");
    }
}

TEST_F(InstalledProfileTest, AMalformedOneIsRefusedWithFileAndLine) {
    install("read /\n\nallow everything\n");

    const auto report = probe({"list", "/"});

    EXPECT_EQ(report.refusal,
              "-1 " + profilePath().string() + ": line 3: the word \"allow\" is unknown");
    EXPECT_FALSE(report.result);
}

TEST_F(InstalledProfileTest, APathThatIsNotThereIsPassedOver) {
    install("read /no/such/folder\nread /etc/passwd/below\nread /\n");

    EXPECT_EQ(probe({"list", "/"}).result, 0);
}

TEST_F(InstalledProfileTest, APathThatCannotBeResolvedIsRefusedWithFileAndLine) {
    const std::string loop = folder().path() / "loop";
    std::filesystem::create_symlink(loop, loop);
    install("read /\nread " + loop + "\n");

    EXPECT_EQ(probe({"list", "/"}).refusal, "-1 " + profilePath().string() + ": line 2: " + loop +
                                                ": Too many levels of symbolic links");
}

TEST_F(InstalledProfileTest, ALargeFileIsRefused) {
    install(std::string(64 * 1024, '#'));
    EXPECT_EQ(probe({"socket", "inet"}).result, EAFNOSUPPORT) << "just fits";

    install(std::string(64 * 1024 + 1, '#'));
    EXPECT_EQ(probe({"socket", "inet"}).refusal,
              "-1 " + profilePath().string() + ": larger than 65536 bytes");
}

TEST_F(InstalledProfileTest, SomethingElseThanAFileIsRefusedAtOnce) {
    std::filesystem::create_directories(profilePath().parent_path());
    ASSERT_EQ(mkfifo(profilePath().c_str(), 0600), 0);

    EXPECT_EQ(probe({"list", "/"}).refusal, "-1 " + profilePath().string() + ": not a plain file");
}

}  // namespace vlm::test
