// What a piece of work costs in time and memory, measured in a process of its own.

#pragma once

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstddef>
#include <functional>
#include <optional>

namespace vlm::test {

struct Cost {
    bool answer = false;
    std::chrono::microseconds time{};  // of the processor: others may use the machine as well
    std::size_t kibibytes = 0;         // by which the process grew at most
};

struct Usage {
    std::chrono::microseconds time{};
    std::size_t peak = 0;
};

inline Usage usageNow() {
    rusage usage = {};
    getrusage(RUSAGE_SELF, &usage);
    const auto duration = [](timeval time) {
        return std::chrono::seconds(time.tv_sec) + std::chrono::microseconds(time.tv_usec);
    };
    return {duration(usage.ru_utime) + duration(usage.ru_stime),
            static_cast<std::size_t>(usage.ru_maxrss)};
}

// None when the work ended the process. The work answers something, so that it cannot be left out.
inline std::optional<Cost> measured(const std::function<bool()>& work) {
    int ends[2] = {};
    if (pipe(ends) != 0) return std::nullopt;
    const pid_t child = fork();
    if (child < 0) return std::nullopt;
    if (child == 0) {
        const Usage before = usageNow();
        Cost cost;
        cost.answer = work();
        const Usage after = usageNow();
        cost.time = after.time - before.time;
        cost.kibibytes = after.peak - before.peak;
        _exit(write(ends[1], &cost, sizeof cost) == sizeof cost ? 0 : 1);
    }

    close(ends[1]);
    Cost cost;
    const bool isTold = read(ends[0], &cost, sizeof cost) == sizeof cost;
    close(ends[0]);
    int status = 0;
    waitpid(child, &status, 0);
    return isTold && status == 0 ? std::optional(cost) : std::nullopt;
}

// How many times as much a build with sanitizers may take. They keep what was freed, and slow every
// access down; as they count lines too, nothing is inlined there. What grows faster than its input
// takes far more.
#if defined(__has_feature)
#define VLM_HAS_FEATURE(feature) __has_feature(feature)
#else
#define VLM_HAS_FEATURE(feature) 0
#endif
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__) || \
    VLM_HAS_FEATURE(address_sanitizer) || VLM_HAS_FEATURE(thread_sanitizer)
inline constexpr int kTimeAllowance = 40;
inline constexpr int kMemoryAllowance = 10;
#else
inline constexpr int kTimeAllowance = 1;
inline constexpr int kMemoryAllowance = 1;
#endif
#undef VLM_HAS_FEATURE

}  // namespace vlm::test
