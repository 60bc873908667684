#include "platform/linux/preferences_writer.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <optional>
#include <string>
#include <system_error>

#include "platform/linux/file_lock.h"
#include "platform/linux/preferences_record.h"
#include "platform/linux/staged_file.h"
#include "platform/system_log.h"
#include "platform/text.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

using State = PreferencesRecord::State;

constexpr Log kLog(kTokenFramework, "preferences");
constexpr int kMostKeptAside = 1000;

// What could not be read back must not be written.
bool fits(std::size_t size) { return size <= kLargestRecord; }

std::optional<Bytes> serialised(const PropertyList& value) {
    if (const auto xml = writeXmlPropertyList(value, kRecordLimits); xml && fits(xml->size()))
        return Bytes(xml->begin(), xml->end());
    auto binary = writeBinaryPropertyList(value, kRecordLimits);
    if (binary && fits(binary->size())) return binary;
    return std::nullopt;
}

class Writer {
public:
    Writer(const PreferencesFolder& rules, std::string_view domain)
        : _rules(rules), _fileName(recordFileName(domain)), _path(rules.path() + "/" + _fileName) {}

    bool write(const std::vector<PreferencesChange>& changes) {
        _folder = openTrustedFolder(_rules);
        if (!_folder) return failed();
        const auto lock = FileLock::take(_folder, "." + _fileName + ".lock", _rules.patience);
        if (!lock && errno == ETIMEDOUT) return failed("another process keeps its lock");
        if (!lock) return failed();

        const auto record = readRecord(_folder, _fileName, _rules);
        if (record.state == State::Unreadable) return failed(record.problem);
        const auto content = serialised(changed(record.entries, changes));
        if (!content) return failed("a value is no property list, or the record is too large");

        // The old file goes aside last of all, so that a full disk leaves it in its place.
        StagedFile file(_folder, "." + _fileName + ".new");
        if (!file.write(*content, {_rules.fileMode, _rules.owner})) return failed();
        if (!record.problem.empty() && !keepAside(record)) return failed();
        return file.putInPlace(_fileName) || failed();
    }

private:
    bool keepAside(const PreferencesRecord& record) const {
        const char* why = record.state == State::Malformed ? "malformed" : "untrusted";
        for (int number = 1; number <= kMostKeptAside; ++number) {
            const std::string name = text("{}.{}-{}", _fileName, why, number);
            struct stat status {};
            if (fstatat(_folder.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) continue;
            if (errno != ENOENT ||
                renameat(_folder.get(), _fileName.c_str(), _folder.get(), name.c_str()) != 0)
                return false;
            kLog.error("{} was kept aside as {}: {}", _path, name, record.problem);
            return true;
        }
        errno = EEXIST;
        return false;
    }

    // Having no right to write is an answer, not a fault.
    bool failed() const {
        const int error = errno;
        const std::string reason = std::generic_category().message(error);
        if (error != EACCES && error != EPERM) return failed(reason);
        kLog.notice("{} was not written: {}", _path, reason);
        return false;
    }

    bool failed(const std::string& reason) const {
        kLog.error("{} was not written: {}", _path, reason);
        return false;
    }

    const PreferencesFolder& _rules;
    std::string _fileName;
    std::string _path;
    FileDescriptor _folder;
};

}  // namespace

bool writeChanges(const PreferencesFolder& rules, std::string_view domain,
                  const std::vector<PreferencesChange>& changes) {
    return Writer(rules, domain).write(changes);
}

}  // namespace vlm::platform
