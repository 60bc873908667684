// FileStamp: what tells a change of a file without reading it.
//
// Threads: values.
// In tests: tests/integration/preferences/changes_test.cpp

#pragma once

#include <sys/stat.h>

#include <ctime>

namespace vlm::platform {

// Tells a file's content from any other that was or will be at the same path.
struct FileStamp {
    dev_t device = 0;
    ino_t number = 0;
    off_t size = 0;
    timespec modified{};
    timespec changed{};

    static FileStamp of(const struct stat& status) {
        return {status.st_dev, status.st_ino, status.st_size, status.st_mtim, status.st_ctim};
    }
    bool operator==(const FileStamp& other) const {
        const auto equal = [](const timespec& one, const timespec& two) {
            return one.tv_sec == two.tv_sec && one.tv_nsec == two.tv_nsec;
        };
        return device == other.device && number == other.number && size == other.size &&
               equal(modified, other.modified) && equal(changed, other.changed);
    }
};

// The clock that times of change are taken from; to be read before the stamp.
inline timespec clockOfFiles() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME_COARSE, &now);
    return now;
}

// Whether every change from now on gives a file another time of change than the one it has. In the
// tick of the file system's clock in which the last change was made, one more of the same size
// leaves no trace.
inline bool isSettled(const timespec& changed, const timespec& now) {
    // Some file systems keep whole seconds only, or pairs of them; the others lag by a tick of some
    // milliseconds.
    constexpr long kNanoseconds = 1'000'000'000;
    const time_t seconds = now.tv_sec - changed.tv_sec;
    if (changed.tv_nsec == 0) return seconds > 2;
    if (seconds < 0 || seconds > 1) return seconds > 1;
    return seconds * kNanoseconds + now.tv_nsec - changed.tv_nsec > kNanoseconds / 10;
}

}  // namespace vlm::platform
