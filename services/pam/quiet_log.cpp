// The log of what the module shares with other programs: errors only, and where PAM's own lines go.
// A program that lets people in has no place for the rest.

#include <syslog.h>

#include <string>

#include "platform/platform.h"
#include "platform/system_log.h"

namespace vlm::platform {

namespace {

class QuietLog final : public SystemLog {
public:
    bool collects(LogLevel level) const override { return level == LogLevel::Error; }
    void write(const LogRecord& record) override {
        if (!collects(record.level)) return;
        const std::string text(record.text);
        ::syslog(LOG_AUTHPRIV | LOG_ERR, "pam_vlm: %s", text.c_str());
    }
};

}  // namespace

SystemLog& Platform::systemLog() {
    static auto& service = *new QuietLog;
    return service;
}

}  // namespace vlm::platform
