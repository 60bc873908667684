#include "tests/integration/preferences/test_folders.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iterator>

namespace vlm::test {

TestFolders::TestFolders() {
    // For CapturedLog. Before the first line is logged, which settles where the others go.
    ::setenv("VLM_LOG_TARGET", "stderr", 1);
    const std::string base = _folder.path() / "etc";
    const std::string home = _folder.path() / "home";
    for (const auto& each : {base, home}) {
        std::filesystem::create_directory(each);
        ::chmod(each.c_str(), 0755);
    }
    const uid_t owner = ::geteuid();
    _folders.managed = {base, {"vlm", "managed"}, owner};
    _folders.anyUser = {base, {"vlm", "preferences"}, owner};
    _folders.currentUser =
        platform::PreferencesFolder{home, {"vlm", "hosts", "here"}, owner, S_IWOTH, 0700, 0600};
}

Path TestFolders::managed(const std::string& domain) const {
    return Path(_folders.managed.path()) / (domain + ".plist");
}

Path TestFolders::record(User user, const std::string& domain) const {
    const auto& folder = user == User::Any ? _folders.anyUser : *_folders.currentUser;
    return Path(folder.path()) / (domain + ".plist");
}

void TestFolders::write(const Path& file, const std::string& content) {
    for (auto folder = file.parent_path(); !std::filesystem::exists(folder);) {
        std::filesystem::create_directories(folder);
        ::chmod(folder.c_str(), 0755);
    }
    const auto staged = file.parent_path() / "staged";
    std::ofstream(staged, std::ios::binary) << content;
    ::chmod(staged.c_str(), 0644);
    std::filesystem::rename(staged, file);
}

std::string TestFolders::binary(const List& content) {
    const auto bytes = platform::writeBinaryPropertyList(content);
    return bytes ? std::string(bytes->begin(), bytes->end()) : std::string();
}

std::string TestFolders::bytesOf(const Path& file) {
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), {}};
}

std::optional<List> TestFolders::read(const Path& file) {
    const auto bytes = bytesOf(file);
    return platform::readPropertyList(platform::Bytes(bytes.begin(), bytes.end()));
}

CapturedLog::CapturedLog() { ::testing::internal::CaptureStderr(); }

CapturedLog::~CapturedLog() { std::ignore = ::testing::internal::GetCapturedStderr(); }

std::string CapturedLog::text() {
    auto text = ::testing::internal::GetCapturedStderr();
    ::testing::internal::CaptureStderr();
    return text;
}

int CapturedLog::lines() {
    const auto logged = text();
    return static_cast<int>(std::ranges::count(logged, '\n'));
}

}  // namespace vlm::test
