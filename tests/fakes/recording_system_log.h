#pragma once

#include <mutex>
#include <string>
#include <vector>

#include "platform/system_log.h"

namespace vlm::fakes {

// Keeps every line of every level; written to by any thread.
class RecordingSystemLog final : public platform::SystemLog {
public:
    struct Line {
        std::string subsystem;
        std::string category;
        platform::LogLevel level;
        std::string text;
        std::string activity = {};
        bool operator==(const Line&) const = default;
    };

    bool collects(platform::LogLevel) const override { return true; }

    void write(const platform::LogRecord& record) override {
        const std::lock_guard lock(_mutex);
        _lines.push_back({std::string(record.subsystem), std::string(record.category), record.level,
                          std::string(record.text), std::string(record.activity)});
    }

    std::vector<Line> lines() const {
        const std::lock_guard lock(_mutex);
        return _lines;
    }

    // The texts of one level, in order.
    std::vector<std::string> texts(platform::LogLevel level) const {
        std::vector<std::string> texts;
        for (const auto& line : lines())
            if (line.level == level) texts.push_back(line.text);
        return texts;
    }

    bool has(platform::LogLevel level, const std::string& text) const {
        for (const auto& each : texts(level))
            if (each == text) return true;
        return false;
    }

private:
    mutable std::mutex _mutex;
    std::vector<Line> _lines;
};

}  // namespace vlm::fakes
