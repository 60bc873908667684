// TestFolders: preferences in a temporary folder, trusted to whoever runs the test.
//
// Values written by hand are binary property lists, replaced in one step as another program would.

#pragma once

#include <filesystem>
#include <string>

#include "platform/linux/preferences_folders.h"
#include "platform/preferences.h"
#include "platform/property_list.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

inline constexpr const char* kDomain = "org.example.test";

using Path = std::filesystem::path;
using List = platform::PropertyList;
using User = platform::PreferencesUser;

class TestFolders {
public:
    TestFolders();

    // Where the store under test looks.
    platform::PreferencesFolders& folders() { return _folders; }

    Path managed(const std::string& domain = kDomain) const;
    Path record(User user, const std::string& domain = kDomain) const;

    static void write(const Path& file, const List& content) { write(file, binary(content)); }
    static void write(const Path& file, const std::string& content);
    static std::string binary(const List& content);

    // The file's list; none when there is no file or no list in it.
    static std::optional<List> read(const Path& file);
    static std::string bytesOf(const Path& file);

private:
    TemporaryFolder _folder;
    platform::PreferencesFolders _folders;
};

// The log goes to standard error, where gtest captures it. What was logged since the last call or
// since the test began.
class CapturedLog {
public:
    CapturedLog();
    ~CapturedLog();
    CapturedLog(const CapturedLog&) = delete;
    CapturedLog& operator=(const CapturedLog&) = delete;

    std::string text();
    int lines();
};

}  // namespace vlm::test
