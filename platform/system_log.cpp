#include "platform/system_log.h"

#include "platform/platform.h"

namespace vlm::platform {

bool Log::collects(LogLevel level) { return current().systemLog().collects(level); }

void Log::deliver(LogLevel level, const std::string& line) const {
    current().systemLog().write({_subsystem, _category, level, line});
}

}  // namespace vlm::platform
