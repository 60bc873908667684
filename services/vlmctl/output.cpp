#include "services/vlmctl/output.h"

#include "services/vlmctl/shown.h"

namespace vlm::control {

void Output::complain(std::string_view text) {
    _complaints << "vlmctl: " << shown(text) << std::endl;
}

bool Output::flush() {
    if (_output.flush()) return true;
    complain("cannot write to standard output");
    return false;
}

}  // namespace vlm::control
