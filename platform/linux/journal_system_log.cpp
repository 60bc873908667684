// Where this file calls the journal says nothing about where a line comes from.
#define SD_JOURNAL_SUPPRESS_LOCATION

#include "platform/linux/journal_system_log.h"

#include <sys/uio.h>
#include <syslog.h>
#include <systemd/sd-journal.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <optional>
#include <vector>

#include "platform/linux/readable_text.h"
#include "platform/platform.h"

namespace vlm::platform {

namespace {

using Target = JournalSystemLog::Target;

constexpr const char* kJournalSocket = "/run/systemd/journal/socket";
constexpr std::size_t kMostLineBytes = 8192;

struct Level {
    std::string_view name;
    int priority;
};

// In the order of LogLevel.
constexpr std::array kLevels{Level{"error", LOG_ERR}, Level{"default", LOG_NOTICE},
                             Level{"info", LOG_INFO}, Level{"debug", LOG_DEBUG}};

const Level& levelOf(const LogRecord& record) {
    return kLevels.at(static_cast<std::size_t>(record.level));
}

std::string_view environment(const char* name) {
    const char* value = ::secure_getenv(name);
    return value ? value : "";
}

LogLevel wantedLevel() {
    const auto* wanted = std::ranges::find(kLevels, environment("VLM_LOG_LEVEL"), &Level::name);
    return wanted == kLevels.end() ? LogLevel::Info
                                   : static_cast<LogLevel>(wanted - kLevels.begin());
}

Target wantedTarget() {
    const std::string_view wanted = environment("VLM_LOG_TARGET");
    if (wanted == "journal") return Target::Journal;
    if (wanted == "stderr") return Target::StandardError;
    if (wanted == "syslog") return Target::Syslog;
    return wanted == "none" ? Target::Nowhere : Target::Any;
}

std::string categoryAndText(const LogRecord& record) {
    return readable(record.category, kMostLineBytes) + ": " + readable(record.text, kMostLineBytes);
}

void writeToJournal(const LogRecord& record) {
    std::vector<std::string> fields{
        "MESSAGE=" + std::string(record.text),
        "PRIORITY=" + std::to_string(levelOf(record).priority),
        "SUBSYSTEM=" + std::string(record.subsystem),
        "CATEGORY=" + std::string(record.category),
        "SYSLOG_IDENTIFIER=" + std::string(program_invocation_short_name),
    };
    if (!record.activity.empty()) fields.push_back("ACTIVITY=" + std::string(record.activity));
    std::vector<iovec> parts;
    parts.reserve(fields.size());
    for (auto& field : fields) parts.push_back({field.data(), field.size()});
    sd_journal_sendv(parts.data(), static_cast<int>(parts.size()));
}

// One write for the line, so that lines of several threads do not mix.
void writeToStandardError(const LogRecord& record) {
    const std::string line =
        std::string(levelOf(record).name) + " " + categoryAndText(record) + "\n";
    while (::write(STDERR_FILENO, line.data(), line.size()) < 0 && errno == EINTR) {
    }
}

void writeToSyslog(const LogRecord& record) {
    ::syslog(levelOf(record).priority, "%s", categoryAndText(record).c_str());
}

}  // namespace

JournalSystemLog::JournalSystemLog() : _leastUrgent(wantedLevel()), _target(wantedTarget()) {
    if (_target != Target::Any) return;
    if (::access(kJournalSocket, F_OK) == 0) {
        _target = Target::Journal;
    } else if (::isatty(STDERR_FILENO) == 0) {
        _target = Target::Syslog;
    } else {
        _target = Target::StandardError;
        _leastUrgent = LogLevel::Error;
    }
}

bool JournalSystemLog::collects(LogLevel level) const {
    return _target != Target::Nowhere && level <= _leastUrgent;
}

void JournalSystemLog::write(const LogRecord& given) {
    if (!collects(given.level)) return;
    LogRecord record = given;
    if (record.text.ends_with('\n')) record.text.remove_suffix(1);
    const int before = errno;  // what the caller is just about to look at
    if (_target == Target::Journal) writeToJournal(record);
    if (_target == Target::StandardError) writeToStandardError(record);
    if (_target == Target::Syslog) writeToSyslog(record);
    errno = before;
}

SystemLog& Platform::systemLog() {
    static auto& service = *new JournalSystemLog;
    return service;
}

}  // namespace vlm::platform
