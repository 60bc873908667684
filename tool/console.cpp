#include "tool/console.h"

#include "util/bind_utils.h"

namespace vlm {

void Console::print(const std::string& line) {
    BindUtils::log().notice("{}\n", line);
    _output << line << '\n';
}

void Console::complain(const std::string& line) {
    BindUtils::log().error("{}", line);
    _complaints << "vlmbind: " << line << std::endl;
}

bool Console::flush() {
    if (_output.flush()) return true;
    complain("Cannot write to standard output.");
    return false;
}

}  // namespace vlm
