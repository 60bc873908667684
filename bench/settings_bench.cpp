// What it costs to ask for a setting again when nothing has changed on the disk.

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "bench/interleaved.h"
#include "bench/temporary_folder.h"
#include "platform/linux/file_preferences.h"
#include "platform/property_list.h"
#include "settings/smartcard_settings.h"

namespace vlm::bench {
namespace {

using namespace platform;

constexpr const char* kDomain = "org.vlm.smartcard";
constexpr auto kMost = std::chrono::microseconds(20);

PreferencesFolder folderIn(const std::filesystem::path& parent, const char* name) {
    PreferencesFolder folder;
    folder.base = parent;
    folder.own = {name};
    folder.owner = geteuid();
    return folder;
}

void writeRecord(const PreferencesFolder& folder, int keys) {
    PropertyList::Dictionary record;
    for (int key = 0; key < keys; ++key) record.append("key-" + std::to_string(key), key);
    record.append("UserPairing", true);
    const auto text = writeXmlPropertyList(record);
    std::filesystem::create_directories(folder.path());
    std::ofstream(folder.path() + "/" + kDomain + ".plist") << text.value();
}

bool reportTime(const char* what, std::chrono::duration<double> time) {
    const bool reached = time < kMost;
    std::printf("%-44s %9s | goal under %s %s\n", what, shown(time).c_str(), shown(kMost).c_str(),
                reached ? "reached" : "MISSED");
    return reached;
}

bool measure(const std::filesystem::path& parent) {
    const PreferencesFolders folders{folderIn(parent, "managed"), folderIn(parent, "machine"),
                                     folderIn(parent, "user")};
    writeRecord(folders.managed, 100);
    writeRecord(folders.anyUser, 100);
    FilePreferences preferences(folders);
    // Files that were just written are read each time, since a change of the same moment would not
    // show in their times.
    timespec pause{.tv_sec = 1, .tv_nsec = 0};
    nanosleep(&pause, nullptr);

    const auto time = medianTimes(
        {
            {"forced", [&] { keep(preferences.isForced("UserPairing", kDomain)); }, 1000},
            {"machine",
             [&] { keep(preferences.value("UserPairing", kDomain, PreferencesUser::Any)); }, 1000},
            {"setting", [] { keep(VLGetSmartcardSetting(String("UserPairing"))); }, 1000},
        },
        50);
    const bool records = reportTime("a value of two records of 101 keys", time[0] + time[1]);
    return reportTime("VLGetSmartcardSetting, as this machine has it", time[2]) && records;
}

}  // namespace
}  // namespace vlm::bench

int main() {
    // What the log costs is its receiver's matter.
    setenv("VLM_LOG_TARGET", "none", 1);
    const vlm::bench::TemporaryFolder folder;
    return vlm::bench::measure(folder.path()) ? 0 : 1;
}
