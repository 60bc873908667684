#include "tests/contracts/preferences_contract.h"

#include <filesystem>

#include "fake_preferences.h"
#include "platform/linux/file_preferences.h"
#include "tests/integration/preferences/test_folders.h"

namespace vlm::test {

namespace {

class FakePreferencesBackend : public contracts::FakeBackend<fakes::FakePreferences> {
public:
    void force(const std::string& key, const std::string& domain, const List& value) {
        get().force(key, domain, value);
    }
    void put(const std::string& key, const std::string& domain, User user, const List& value) {
        get().put(key, domain, user, value);
    }
    std::optional<List> written(const std::string& key, const std::string& domain, User user) {
        return get().written(key, domain, user);
    }
    void refuseWrites() { get().refuseWrites(); }
};

class FilePreferencesBackend {
public:
    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::Preferences& get() { return _preferences; }

    void force(const std::string& key, const std::string& domain, const List& value) {
        change(_folders.managed(domain), key, value);
    }
    void put(const std::string& key, const std::string& domain, User user, const List& value) {
        change(_folders.record(user, domain), key, value);
    }
    std::optional<List> written(const std::string& key, const std::string& domain, User user) {
        return platform::FilePreferences(_folders.folders()).value(key, domain, user);
    }
    // With something else in the lock's place; modes would not stop the superuser.
    void refuseWrites() {
        for (const auto user : {User::Any, User::Current})
            std::filesystem::create_directories(_folders.record(user).parent_path() /
                                                ".org.example.one.plist.lock");
    }

private:
    static void change(const Path& file, const std::string& key, const List& value) {
        auto entries = List::Dictionary();
        if (const auto content = TestFolders::read(file)) entries = *content->dictionary();
        entries.set(key, value);
        TestFolders::write(file, List(entries));
    }

    TestFolders _folders;
    platform::FilePreferences _preferences{_folders.folders()};
};

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, PreferencesContract, test::FakePreferencesBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(File, PreferencesContract, test::FilePreferencesBackend);
}  // namespace vlm::contracts
