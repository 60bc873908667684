// MachineSettings: this machine with the smart-card settings of a test's own in its /etc, for
// programs that run in a mount namespace.
//
// Threads: one at a time.

#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "platform/property_list.h"
#include "tests/integration/linux/changed_machine.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

class MachineSettings {
public:
    using Dictionary = platform::PropertyList::Dictionary;

    MachineSettings();

    // What management forces, and what is set for the machine.
    void force(const Dictionary& settings) const;
    void set(const Dictionary& settings) const;

    // The folder that stands in the place of /etc.
    const std::filesystem::path& etc() const { return _etc.path(); }
    std::filesystem::path configurationFile() const { return etc() / "SmartcardLogin.plist"; }

    // The command line that runs the program there.
    std::vector<std::string> commandLine(const std::vector<std::string>& program) const {
        return _machine.commandLine(program);
    }

private:
    TemporaryFolder _etc;
    ChangedMachine _machine;
};

// The list as a file holds it.
std::string binary(const platform::PropertyList& list);

}  // namespace vlm::test
