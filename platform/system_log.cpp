#include "platform/system_log.h"

#include <utility>

#include "platform/platform.h"

namespace vlm::platform {

namespace {
thread_local std::string_view currentActivity;
}

LogActivity::LogActivity(std::string_view name) : _outer(std::exchange(currentActivity, name)) {}

LogActivity::~LogActivity() { currentActivity = _outer; }

bool Log::collects(LogLevel level) { return current().systemLog().collects(level); }

void Log::deliver(LogLevel level, const std::string& line) const {
    current().systemLog().write({_subsystem, _category, level, line, currentActivity});
}

}  // namespace vlm::platform
