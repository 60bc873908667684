// Where a confined program may keep the user's preferences.

#include <sys/stat.h>
#include <unistd.h>

#include "probe_test.h"

namespace vlm::test {

namespace {

class PreferencesFolderTest : public ProbeTest {
protected:
    void SetUp() override {
        if (landlockVersion() == 0) GTEST_SKIP() << "this kernel does not confine files";
    }

    // Whether the confined program can make, rename and remove things there, as a store does.
    void expectRoomIn(const std::filesystem::path& folder) const {
        EXPECT_EQ(probe({"mkdir", folder / "hosts"}).result, 0);
        EXPECT_EQ(probe({"create", folder / "hosts/new"}).result, 0);
        EXPECT_EQ(probe({"rename", folder / "hosts/new", folder / "hosts/kept"}).result, 0);
        EXPECT_EQ(probe({"unlink", folder / "hosts/kept"}).result, 0);
        EXPECT_EQ(probe({"create", folder.parent_path() / "beside"}).result, EACCES);
    }
};

}  // namespace

TEST_F(PreferencesFolderTest, IsMadeForAUserWhoHasNone) {
    ASSERT_FALSE(std::filesystem::exists(home() / ".config"));

    expectRoomIn(home() / ".config/vlm");

    struct stat status {};
    ASSERT_EQ(stat((home() / ".config/vlm").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0700U);
}

TEST_F(PreferencesFolderTest, IsWhereTheEnvironmentWantsIt) {
    configurationHome = elsewhere() / "made";

    expectRoomIn(elsewhere() / "made/vlm");
    EXPECT_FALSE(std::filesystem::exists(home() / ".config"));
}

TEST_F(PreferencesFolderTest, IsNotInTheHomeFolderWhenTheEnvironmentWantsItElsewhere) {
    std::filesystem::create_directories(home() / ".config/vlm");
    configurationHome = elsewhere();

    EXPECT_EQ(probe({"create", home() / ".config/vlm/new"}).result, EACCES);
}

TEST_F(PreferencesFolderTest, ThatCannotBeMadeLeavesTheProgramConfinedWithoutOne) {
    fileIn(home());
    configurationHome = home() / "file";

    const auto report = probe({"create", home() / "new"});

    EXPECT_EQ(report.refusal, "");
    EXPECT_EQ(report.result, EACCES);
}

TEST_F(PreferencesFolderTest, OfSomebodyElseIsNotTheSuperusers) {
    if (geteuid() != 0) GTEST_SKIP() << "only root can give a folder to another user";
    std::filesystem::create_directories(home() / ".config/vlm");
    ASSERT_EQ(chown(home().c_str(), 65534, 65534), 0);
    ASSERT_EQ(chown((home() / ".config").c_str(), 65534, 65534), 0);
    cacheHome = elsewhere();

    EXPECT_EQ(probe({"create", home() / ".config/vlm/new"}).result, EACCES);

    std::filesystem::remove_all(home() / ".config");
    EXPECT_EQ(probe({"create", home() / ".config/vlm/new"}).result, ENOENT);
    EXPECT_TRUE(std::filesystem::is_empty(home()));
}

}  // namespace vlm::test
