#include "platform/linux/preferences_record.h"

#include <fcntl.h>

#include <cerrno>
#include <functional>
#include <system_error>
#include <utility>

#include "platform/linux/read_to_end.h"
#include "platform/text.h"

namespace vlm::platform {

namespace {

using State = PreferencesRecord::State;

constexpr int kFlags = O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

PreferencesRecord withoutFile() {
    PreferencesRecord record;
    if (errno == ENOENT) return record;
    record.state = State::Unreadable;
    record.problem = text("it cannot be read: {}", std::generic_category().message(errno));
    return record;
}

// Why the file cannot be a record at all, whatever it holds.
std::optional<std::string> malformation(const struct stat& status) {
    if (!S_ISREG(status.st_mode)) return "it is not a plain file";
    if (status.st_size > static_cast<off_t>(kLargestRecord))
        return text("it is larger than {} bytes", kLargestRecord);
    return std::nullopt;
}

void judge(PreferencesRecord& record, const struct stat& status, const PreferencesFolder& rules) {
    if (const auto reason = malformation(status)) {
        record.state = State::Malformed;
        record.problem = *reason;
    } else if (!rules.trusts(status)) {
        record.state = State::Untrusted;
        record.problem = text("not only the user with the id {} can write it", rules.owner);
    } else {
        record.state = State::Good;
    }
}

void parse(PreferencesRecord& record, const Bytes& content) {
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-reinterpret-cast): the same bytes as text
    const std::string_view bytes(reinterpret_cast<const char*>(content.data()), content.size());
    record.contentHash = std::hash<std::string_view>()(bytes);
    record.state = State::Malformed;
    if (content.size() > kLargestRecord) {
        record.problem = text("it is larger than {} bytes", kLargestRecord);
        return;
    }
    const auto list = readPropertyList(content, kRecordLimits);
    if (!list || !list->dictionary()) {
        record.problem = list ? "it holds no dictionary" : "it is no property list";
        return;
    }
    record.state = State::Good;
    record.entries = *list->dictionary();
}

}  // namespace

PreferencesRecord readRecord(const FileDescriptor& folder, const std::string& fileName,
                             const PreferencesFolder& rules) {
    // The clock first, then the stamp, then the content: what changes in between shows later.
    const timespec now = clockOfFiles();
    struct stat status {};
    if (fstatat(folder.get(), fileName.c_str(), &status, 0) != 0) return withoutFile();
    FileDescriptor file;
    // Only a plain file is opened: with a device or a pipe the opening alone has effects.
    if (S_ISREG(status.st_mode)) {
        file = FileDescriptor(openat(folder.get(), fileName.c_str(), kFlags));
        if (!file || fstat(file.get(), &status) != 0) return withoutFile();
    }

    PreferencesRecord record;
    judge(record, status, rules);
    if (record.state == State::Good) {
        const auto content =
            readToEnd(file.get(), kLargestRecord, static_cast<std::size_t>(status.st_size));
        if (!content) return withoutFile();
        parse(record, *content);
    }
    if (isSettled(status.st_ctim, now)) record.stamp = FileStamp::of(status);
    return record;
}

}  // namespace vlm::platform
