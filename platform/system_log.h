// SystemLog: where this system's log lines go, and Log, the handle that components write through.
//
// Shapes:    a record has a subsystem, a category, a level, one text (UTF-8; it may hold line
//            feeds) and, where there is one, the activity that it belongs to. Secrets never come
//            here.
// Threads:   any.
// Blocking:  no; a line that cannot be delivered at once is lost.
// Errors:    none are reported: logging never fails its caller.
// Behind it: platform/linux/journal_system_log.h
// In tests:  tests/fakes/recording_system_log.h, tests/contracts/system_log_contract.h

#pragma once

#include <string>
#include <string_view>

#include "platform/text.h"

namespace vlm::platform {

enum class LogLevel { Error, Default, Info, Debug };  // most to least urgent

struct LogRecord {
    std::string_view subsystem;
    std::string_view category;
    LogLevel level = LogLevel::Default;
    std::string_view text;
    std::string_view activity = {};  // empty for none
};

class SystemLog {
public:
    virtual ~SystemLog() = default;

    // Whether anybody reads lines of this level; asked before a line is made, so that one that
    // nobody collects costs nothing.
    virtual bool collects(LogLevel level) const = 0;

    virtual void write(const LogRecord& record) = 0;
};

// What this thread does while the object lives, and so what its lines are about: an event that came
// in, a button that a person clicked. The inner one of two counts. Work that is handed to another
// thread opens it there anew.
class LogActivity {
public:
    // The name must outlive the object.
    explicit LogActivity(std::string_view name);
    ~LogActivity();
    LogActivity(const LogActivity&) = delete;
    LogActivity& operator=(const LogActivity&) = delete;

private:
    const std::string_view _outer;
};

// A component's handle on the log: one subsystem and one category. Made once per component.
class Log {
public:
    // Both texts must outlive the handle.
    constexpr Log(std::string_view subsystem, std::string_view category)
        : _subsystem(subsystem), _category(category) {}

    template <typename... Values>
    void error(std::string_view pattern, const Values&... values) const {
        write(LogLevel::Error, pattern, values...);
    }
    // The default level: what an administrator wants to see without asking.
    template <typename... Values>
    void notice(std::string_view pattern, const Values&... values) const {
        write(LogLevel::Default, pattern, values...);
    }
    template <typename... Values>
    void info(std::string_view pattern, const Values&... values) const {
        write(LogLevel::Info, pattern, values...);
    }
    template <typename... Values>
    void debug(std::string_view pattern, const Values&... values) const {
        write(LogLevel::Debug, pattern, values...);
    }

private:
    template <typename... Values>
    void write(LogLevel level, std::string_view pattern, const Values&... values) const {
        if (!collects(level)) return;
        deliver(level, text(pattern, values...));
    }

    static bool collects(LogLevel level);
    void deliver(LogLevel level, const std::string& line) const;

    std::string_view _subsystem;
    std::string_view _category;
};

}  // namespace vlm::platform
