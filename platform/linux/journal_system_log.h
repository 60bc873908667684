// The journal as the system log, with fields to search by: SUBSYSTEM, CATEGORY and ACTIVITY.
//
// Without a journal, lines go to syslog; or, where standard error is a terminal, only errors are
// shown there, since a command prints for the person what it logs below that level.
//
// The environment, read once, and not in a program with raised privileges:
//   VLM_LOG_TARGET  journal, stderr, syslog or none
//   VLM_LOG_LEVEL   error, default, info or debug: the least urgent level that is written;
//                   info when it is not set
//
// Lines on standard error and in syslog are "LEVEL CATEGORY: TEXT" and "CATEGORY: TEXT", with
// control characters escaped.

#pragma once

#include <string>

#include "platform/system_log.h"

namespace vlm::platform {

class JournalSystemLog final : public SystemLog {
public:
    enum class Target { Any, Journal, StandardError, Syslog, Nowhere };

    JournalSystemLog();

    bool collects(LogLevel level) const override;
    void write(const LogRecord& record) override;

private:
    LogLevel _leastUrgent;
    Target _target;
};

}  // namespace vlm::platform
