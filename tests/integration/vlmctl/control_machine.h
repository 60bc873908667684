// ControlMachine: the Machine with vlmctl on it, and an /etc of a test's own for the runs that look
// at settings.

#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "machine.h"
#include "tests/integration/linux/changed_machine.h"

namespace vlm::test {

inline constexpr uid_t kOrdinaryUser = 65534;

class ControlMachine {
public:
    ControlMachine();

    // Runs vlmctl on this machine as it is, as the user that the test runs as or as another.
    Ended vlmctl(std::vector<std::string> arguments, std::optional<uid_t> user = std::nullopt);

    // Runs it as the superuser, or with the program that comes first in `before`, on a machine
    // whose /etc holds nothing but the accounts and what the test put there. A mount namespace is
    // needed; see ChangedMachine.
    Ended vlmctlWithOwnEtc(std::vector<std::string> arguments,
                           std::vector<std::string> before = {});

    // Writes a file of that /etc, and reads one; an empty text for one that is not there.
    void writeEtc(const std::string& name, const std::string& text) const;
    std::string readEtc(const std::string& name) const;

    // A command line for a shell.
    std::string program() const { return _program; }

    Machine machine;

private:
    std::string _program;
    TemporaryFolder _etc;
    ChangedMachine _changed;
};

// A property list in XML around these entries.
std::string xmlList(const std::string& entries);

}  // namespace vlm::test
