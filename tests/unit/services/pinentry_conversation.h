#pragma once

#include <string>
#include <vector>

#include "services/hints/pinentry_dialog.h"

namespace vlm::service {

// Everything that we say to a program that answers OK to all of it, up to the request for the PIN.
inline std::vector<std::string> sayAll(PinentryDialog& dialog) {
    std::vector<std::string> said;
    auto line = dialog.take("OK Pleased to meet you");
    while (!line.empty()) {
        said.push_back(line);
        if (line == "GETPIN\n") break;
        line = dialog.take("OK");
    }
    return said;
}

}  // namespace vlm::service
