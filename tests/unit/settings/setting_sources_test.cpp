// Every key with every combination of what the three records may hold about it.

#include "setting_cases.h"
#include "settings_fixture.h"

namespace vlm {
namespace {

class SettingSources : public fakes::PlatformTest {
protected:
    // A store reads a malformed record as one without the key.
    void arrange(const std::string& key, const StoredCase& managed, const StoredCase& machine,
                 const StoredCase& user) {
        using User = platform::PreferencesUser;
        const std::string domain(kSmartcardDomain);
        preferences() = {};
        if (managed.value) preferences().force(key, domain, *managed.value);
        if (machine.value) preferences().put(key, domain, User::Any, *machine.value);
        if (user.value) preferences().put(key, domain, User::Current, *user.value);
    }
};

TEST_F(SettingSources, DecideAsTheRulesSayInEveryCombination) {
    int combinations = 0;
    for (const auto& setting : settingCases())
        for (const auto& managed : storedCases())
            for (const auto& machine : storedCases())
                for (const auto& user : storedCases()) {
                    arrange(setting.key, managed, machine, user);
                    const auto expected = expectedSetting(setting, managed, machine);

                    EXPECT_EQ(VLGetSmartcardSetting(setting.key), expected.value)
                        << setting.key << ": managed " << managed.name << ", machine "
                        << machine.name << ", user " << user.name;
                    EXPECT_EQ(VLGetSmartcardSettingOrigin(setting.key), expected.origin)
                        << setting.key << ": managed " << managed.name << ", machine "
                        << machine.name << ", user " << user.name;
                    ++combinations;
                }

    EXPECT_EQ(combinations, 9 * 9 * 9 * 9);
}

}  // namespace
}  // namespace vlm
