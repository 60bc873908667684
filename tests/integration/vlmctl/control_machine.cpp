#include "control_machine.h"

#include <filesystem>
#include <fstream>
#include <iterator>

namespace vlm::test {

ControlMachine::ControlMachine() : _program(machine.tool().parent_path() / "vlmctl") {
    std::filesystem::copy(std::filesystem::path(VLM_BUILD_TREE) / "bin" / "vlmctl", _program);
    writeEtc("nsswitch.conf", "passwd: files\ngroup: files\n");
    writeEtc("passwd", "root:x:0:0::/root:/bin/sh\nalice:x:1000:1000::/home/alice:/bin/sh\n");
    writeEtc("group", "root:x:0:\nalice:x:1000:\n");
    _changed.replace("/etc", _etc.path());
}

Ended ControlMachine::vlmctl(std::vector<std::string> arguments, std::optional<uid_t> user) {
    arguments.insert(arguments.begin(), _program);
    return machine.run(std::move(arguments), user);
}

Ended ControlMachine::vlmctlWithOwnEtc(std::vector<std::string> arguments,
                                       std::vector<std::string> before) {
    before.push_back(_program);
    before.insert(before.end(), arguments.begin(), arguments.end());
    return machine.run(_changed.commandLine(before));
}

void ControlMachine::writeEtc(const std::string& name, const std::string& text) const {
    _etc.write(name, text);
}

std::string ControlMachine::readEtc(const std::string& name) const {
    std::ifstream file(_etc.path() / name, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

std::string xmlList(const std::string& entries) {
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">\n<dict>\n" +
           entries + "</dict>\n</plist>\n";
}

}  // namespace vlm::test
