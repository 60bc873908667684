// Tries every setting with every combination of what the real records may hold: the ones below
// /etc, and the user's own below the folder that is given:
//
//     settings_table USER-RECORD-FOLDER
//
// Prints each combination that does not answer as the rules say, and then how many were tried. It
// is one process, so that a change on the disk that it did not see would show.

#include <filesystem>
#include <fstream>
#include <iostream>
#include <string>

#include "platform/linux/preferences_folders.h"
#include "settings/smartcard_settings.h"
#include "tests/unit/settings/setting_cases.h"

namespace {

using vlm::StoredCase;
using vlm::platform::PropertyList;

const std::filesystem::path kFile = "org.vlm.smartcard.plist";

// The record with every key at once. A new file takes its place, as when a program writes it.
void put(const std::filesystem::path& folder, const StoredCase& stored) {
    PropertyList::Dictionary record{{"somethingElse", 1}};
    if (stored.value)
        for (const auto& setting : vlm::settingCases()) record.set(setting.key, *stored.value);
    auto bytes = *vlm::platform::writeBinaryPropertyList(record);
    if (stored.isMalformed) bytes.pop_back();

    const auto next = folder / "next";
    std::ofstream(next, std::ios::binary) << std::string(bytes.begin(), bytes.end());
    std::filesystem::rename(next, folder / kFile);
}

int wrongAnswers(const StoredCase& managed, const StoredCase& machine, const StoredCase& user) {
    int wrong = 0;
    for (const auto& setting : vlm::settingCases()) {
        const auto expected = vlm::expectedSetting(setting, managed, machine);
        const auto value = VLGetSmartcardSetting(setting.key);
        if (value == expected.value && VLGetSmartcardSettingOrigin(setting.key) == expected.origin)
            continue;
        std::cout << setting.key << ": managed " << managed.name << ", machine " << machine.name
                  << ", user " << user.name << ": " << value << " instead of " << expected.value
                  << '\n';
        ++wrong;
    }
    return wrong;
}

}  // namespace

int main() {
    const std::filesystem::path own =
        vlm::platform::PreferencesFolders::ofThisMachine().currentUser.value().path();
    std::filesystem::create_directories(own);
    int wrong = 0;
    std::size_t tried = 0;
    for (const auto& managed : vlm::storedCases()) {
        put("/etc/vlm/managed", managed);
        for (const auto& machine : vlm::storedCases()) {
            put("/etc/vlm/preferences", machine);
            for (const auto& user : vlm::storedCases()) {
                put(own, user);
                wrong += wrongAnswers(managed, machine, user);
                tried += vlm::settingCases().size();
            }
        }
    }
    std::cout << tried << " tried, " << wrong << " wrong\n";
    return wrong == 0 ? 0 : 1;
}
