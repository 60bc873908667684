#include "tests/integration/settings/machine_settings.h"

namespace vlm::test {

// The accounts and where to look them up, and the machine's id, are as they were.
MachineSettings::MachineSettings() {
    for (const char* file : {"group", "ld.so.cache", "machine-id", "nsswitch.conf", "passwd"})
        if (const std::filesystem::path real = std::filesystem::path("/etc") / file; exists(real))
            copy_file(real, etc() / file);
    // As the superuser makes them, whatever the mask of the test.
    for (const char* folder : {"vlm", "vlm/managed", "vlm/preferences"}) {
        create_directory(etc() / folder);
        permissions(etc() / folder, std::filesystem::perms(0755));
    }
    _machine.replace("/etc", etc());
}

void MachineSettings::force(const Dictionary& settings) const {
    _etc.write("vlm/managed/org.vlm.smartcard.plist", binary(settings));
}

void MachineSettings::set(const Dictionary& settings) const {
    _etc.write("vlm/preferences/org.vlm.smartcard.plist", binary(settings));
}

std::string binary(const platform::PropertyList& list) {
    const auto bytes = platform::writeBinaryPropertyList(list);
    return {bytes->begin(), bytes->end()};
}

}  // namespace vlm::test
