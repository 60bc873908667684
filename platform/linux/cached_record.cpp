#include "platform/linux/cached_record.h"

#include <cerrno>
#include <system_error>
#include <utility>

#include "platform/system_log.h"
#include "platform/text.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

using State = PreferencesRecord::State;

constexpr Log kLog(kTokenFramework, "preferences");

bool isMissing(int error) { return error == ENOENT || error == ENOTDIR; }

}  // namespace

CachedRecord::CachedRecord(PreferencesFolder folder, std::string_view domain)
    : _folder(std::move(folder)),
      _fileName(recordFileName(domain)),
      _path(_folder.path() + "/" + _fileName) {}

const PropertyList::Dictionary& CachedRecord::entries() {
    if (!isCurrent()) {
        _record = read();
        tellProblem();
    }
    return _record.entries;
}

bool CachedRecord::isCurrent() const {
    struct stat status {};
    if (stat(_path.c_str(), &status) != 0)
        return _record.state == State::Absent && isMissing(errno);
    return _record.stamp && *_record.stamp == FileStamp::of(status);
}

PreferencesRecord CachedRecord::read() const {
    PreferencesRecord record;
    const FileDescriptor folder = openFolder(_folder);
    struct stat status {};
    if (folder && fstat(folder.get(), &status) == 0) {
        record = readRecord(folder, _fileName, _folder);
        if (record.state != State::Good || _folder.trusts(status)) return record;
        // Without a stamp, since mending the folder leaves none on the file.
        record = {};
        record.state = State::Untrusted;
        record.problem =
            text("not only the user with the id {} can write the folder", _folder.owner);
    } else if (!isMissing(errno)) {
        record.state = State::Unreadable;
        record.problem =
            text("the folder cannot be opened: {}", std::generic_category().message(errno));
    }
    return record;
}

void CachedRecord::tellProblem() {
    const bool isTold = _record.problem == _toldProblem && _record.contentHash == _toldContent;
    _toldProblem = _record.problem;
    _toldContent = _record.contentHash;
    if (_record.problem.empty() || isTold) return;
    kLog.error("{} counts as absent: {}", _path, _record.problem);
}

}  // namespace vlm::platform
