#include "tests/integration/linux/changed_machine.h"

#include <unistd.h>

#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

// Takes pairs of a place and what stands in for it, then "--" and the program.
constexpr const char* kMountAndRun =
    "while [ \"$1\" != -- ]; do mount --bind \"$2\" \"$1\" || exit 125; shift 2; done; "
    "shift; exec \"$@\"";

}  // namespace

std::optional<std::string> ChangedMachine::unavailable() {
    static const Ended tried = [] {
        const TemporaryFolder folder;
        ChangedMachine machine;
        machine.replace(folder.path(), folder.path());
        return machine.run({"true"});
    }();
    if (tried.status == 0) return std::nullopt;
    return "no mount namespace can be made here: " + tried.errors;
}

std::vector<std::string> ChangedMachine::commandLine(
    const std::vector<std::string>& program) const {
    std::vector<std::string> line{"unshare", "--mount"};
    if (::geteuid() != 0) line.insert(line.end(), {"--user", "--map-root-user"});
    line.insert(line.end(), {"sh", "-c", kMountAndRun, "sh"});
    for (const auto& [place, with] : _replacements) {
        line.push_back(place.string());
        line.push_back(with.string());
    }
    line.emplace_back("--");
    line.insert(line.end(), program.begin(), program.end());
    return line;
}

}  // namespace vlm::test
