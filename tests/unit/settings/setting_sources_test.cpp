// Every key with every combination of what the three records may hold about it.

#include <map>

#include "setting_cases.h"
#include "settings_fixture.h"

namespace vlm {
namespace {

using platform::PropertyList;

const std::map<std::string, PropertyList> kValues = {
    {"false", false},
    {"true", true},
    {"0", 0},
    {"1", 1},
    {"5", 5},
    {"\"1\"", "1"},
    {"bytes", platform::Bytes{1}},
};

class SettingSources : public fakes::PlatformTest {
protected:
    // A store reads a malformed record as one without a key.
    void arrange(std::string_view key, const StoredCase& managed, const StoredCase& machine,
                 const StoredCase& user) {
        using User = platform::PreferencesUser;
        const std::string name(key);
        const std::string domain(kSmartcardDomain);
        preferences() = {};
        if (managed.isThere) preferences().force(name, domain, kValues.at(managed.name));
        if (machine.isThere) preferences().put(name, domain, User::Any, kValues.at(machine.name));
        if (user.isThere) preferences().put(name, domain, User::Current, kValues.at(user.name));
    }
};

TEST_F(SettingSources, DecideAsTheRulesSayInEveryCombination) {
    int combinations = 0;
    for (const auto& setting : kSettingCases)
        for (const auto& managed : kStoredCases)
            for (const auto& machine : kStoredCases)
                for (const auto& user : kStoredCases) {
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

    EXPECT_EQ(combinations, 8 * 9 * 9 * 9);
}

}  // namespace
}  // namespace vlm
