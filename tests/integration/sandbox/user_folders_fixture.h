// UserFoldersTest: a world with a home folder, a runtime folder and places outside of both.

#pragma once

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "platform/linux/user_folders.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::platform {

inline constexpr uid_t kSomebodyElse = 65534;

inline mode_t modeOf(const std::filesystem::path& path) {
    struct stat status {};
    return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

class UserFoldersTest : public ::testing::Test {
protected:
    UserFoldersTest() {
        for (const auto& each : {runtime(), home(), accountHome(), outside()})
            std::filesystem::create_directories(each);
    }

    std::filesystem::path runtime() const { return _folder.path() / "runtime"; }
    std::filesystem::path home() const { return _folder.path() / "home"; }
    std::filesystem::path accountHome() const { return _folder.path() / "account"; }
    std::filesystem::path outside() const { return _folder.path() / "outside"; }

    UserPlaces places() const { return {runtime(), std::nullopt, home(), accountHome()}; }

    // Whether the folder now belongs to another user; only root can do that.
    static bool giveAway(const std::filesystem::path& path) {
        return geteuid() == 0 && lchown(path.c_str(), kSomebodyElse, kSomebodyElse) == 0;
    }

private:
    test::TemporaryFolder _folder;
};

#define GIVE_AWAY_OR_SKIP(path) \
    if (!giveAway(path)) GTEST_SKIP() << "only root can give a folder to another user"

}  // namespace vlm::platform
