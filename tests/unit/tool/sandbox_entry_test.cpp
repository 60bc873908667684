#include "tool/sandbox_entry.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>

#include "home_folder.h"
#include "platform_test.h"

namespace vlm {
namespace {

namespace fs = std::filesystem;
using platform::LogLevel;

class SandboxEntry : public fakes::PlatformTest {
protected:
    void SetUp() override {
        std::string pattern = fs::temp_directory_path() / "vlm-sandbox-entry-XXXXXX";
        ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
        root = fs::canonical(pattern);
        for (const char* name : {"temp", "cache", "home"}) fs::create_directory(root / name);
        sandbox().temporaryFolder = {root / "temp", 0};
        sandbox().cacheFolder = {root / "cache", 0};
        home.set(root / "home");
    }
    void TearDown() override { fs::remove_all(root); }

    // Refused, with this as the only line in the log, before the sandbox was entered.
    void expectRefusal(const std::string& line) {
        const auto before = log().lines().size();
        EXPECT_FALSE(initSandbox());
        ASSERT_EQ(log().lines().size(), before + 1);
        const auto last = log().lines().back();
        EXPECT_EQ(last.text, line);
        EXPECT_EQ(last.level, LogLevel::Error);
        EXPECT_EQ(last.category, "vlmbind");
        EXPECT_TRUE(sandbox().entered.empty());
    }

    // A folder whose whole path has this many characters.
    fs::path folderOfLength(std::size_t length) {
        fs::path folder = root;
        while (folder.string().size() + 1 < length) {
            const std::size_t missing = length - folder.string().size() - 1;
            // Whatever is left must be enough for a slash and a name.
            folder /= std::string(
                missing <= 200 ? missing : std::min(missing - 2, std::size_t{200}), 'x');
        }
        fs::create_directories(folder);
        EXPECT_EQ(folder.string().size(), length);
        return folder;
    }

    fs::path root;
    fakes::HomeFolder home;
};

TEST_F(SandboxEntry, EntersTheToolsProfileWithItsThreeParametersInOrder) {
    EXPECT_TRUE(initSandbox());

    ASSERT_EQ(sandbox().entered.size(), 1U);
    EXPECT_EQ(sandbox().entered[0].profile, "org.vlm.vlmbind");
    const std::vector<std::pair<std::string, std::string>> expected{
        {"KESTRA_USER_CACHE_DIR", root / "cache"},
        {"KESTRA_USER_TEMP_DIR", root / "temp"},
        {"HOME_DIR", root / "home"}};
    EXPECT_EQ(sandbox().entered[0].parameters, expected);
    EXPECT_TRUE(log().lines().empty());
}

TEST_F(SandboxEntry, ResolvesLinksAndRelativeParts) {
    fs::create_symlink(root / "home", root / "link");
    sandbox().temporaryFolder.path = root / "home" / ".." / "temp" / ".";
    sandbox().cacheFolder.path = (root / "cache").string() + "//";
    home.set(root / "link");

    EXPECT_TRUE(initSandbox());

    const auto& parameters = sandbox().entered.at(0).parameters;
    EXPECT_EQ(parameters[0].second, root / "cache");
    EXPECT_EQ(parameters[1].second, root / "temp");
    EXPECT_EQ(parameters[2].second, root / "home");
}

TEST_F(SandboxEntry, FailsWithoutATemporaryFolder) {
    sandbox().temporaryFolder = {"", EACCES};
    sandbox().cacheFolder = {"", EIO};
    home.unset();

    expectRefusal("Couldn't retrieve private temporary directory path: 13.");
}

TEST_F(SandboxEntry, FailsWhenTheTemporaryFolderCannotBeResolved) {
    sandbox().temporaryFolder.path = root / "missing";
    sandbox().cacheFolder = {"", EIO};

    expectRefusal("Error calling realpath on the private temporary directory path: 2.");
}

TEST_F(SandboxEntry, FailsWithoutACacheFolder) {
    sandbox().cacheFolder = {"", EIO};
    home.unset();

    expectRefusal("Couldn't retrieve private cache directory path: 5.");
}

TEST_F(SandboxEntry, FailsWhenTheCacheFolderCannotBeResolved) {
    sandbox().cacheFolder.path = root / "missing";
    home.unset();

    expectRefusal("Error calling realpath on the private cache directory path: 2.");
}

TEST_F(SandboxEntry, FailsWhenHomeIsNotSet) {
    home.unset();

    expectRefusal("Error calling realpath on the home directory path: 22.");
}

TEST_F(SandboxEntry, FailsWhenHomeCannotBeResolved) {
    home.set(root / "missing");
    expectRefusal("Error calling realpath on the home directory path: 2.");

    home.set("");
    expectRefusal("Error calling realpath on the home directory path: 2.");
}

TEST_F(SandboxEntry, FailsWhenTheProfileCannotBeEntered) {
    sandbox().answer = {-7, "the profile is malformed"};

    EXPECT_FALSE(initSandbox());

    EXPECT_EQ(
        log().texts(LogLevel::Error),
        std::vector<std::string>{"Couldn't initialize sandbox: -7 (the profile is malformed)"});
}

TEST_F(SandboxEntry, TakesAPathThatJustFitsIntoItsBuffer) {
    const auto folder = folderOfLength(1023);
    sandbox().temporaryFolder.path = folder;
    home.set(folder);

    EXPECT_TRUE(initSandbox());

    EXPECT_EQ(sandbox().entered.at(0).parameters[2].second, folder);
}

TEST_F(SandboxEntry, RefusesAPathThatIsTooLongForItsBuffer) {
    const auto folder = folderOfLength(1024);

    home.set(folder);
    expectRefusal("Error calling realpath on the home directory path: 36.");

    sandbox().cacheFolder.path = folder;
    expectRefusal("Couldn't retrieve private cache directory path: 36.");
}

TEST_F(SandboxEntry, RefusesAShortPathThatIsTooLongOnceItIsResolved) {
    fs::create_symlink(folderOfLength(1500), root / "short");
    sandbox().temporaryFolder.path = root / "short";

    expectRefusal("Error calling realpath on the private temporary directory path: 36.");
}

}  // namespace
}  // namespace vlm
