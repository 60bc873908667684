#include "bench/interleaved.h"

#include <time.h>

#include <algorithm>
#include <cstdio>
#include <utility>

namespace vlm::bench {

using Seconds = std::chrono::duration<double>;

namespace {

Seconds now(Clock clock) {
    timespec time{};
    clock_gettime(clock == Clock::Processor ? CLOCK_THREAD_CPUTIME_ID : CLOCK_MONOTONIC, &time);
    return Seconds(static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9);
}

}  // namespace

std::vector<std::vector<Seconds>> turns(const std::vector<Work>& pieces, std::size_t count,
                                        Clock clock) {
    std::vector<std::vector<Seconds>> times(pieces.size());
    for (std::size_t turn = 0; turn < count + 1; ++turn) {
        for (std::size_t i = 0; i < pieces.size(); ++i) {
            const Seconds start = now(clock);
            for (std::size_t n = 0; n < pieces[i].times; ++n) pieces[i].run();
            const Seconds time = now(clock) - start;
            const bool warmsUp = turn == 0;
            if (!warmsUp) times[i].push_back(time / static_cast<double>(pieces[i].times));
        }
    }
    return times;
}

std::vector<Seconds> medianTimes(const std::vector<Work>& pieces, std::size_t turns, Clock clock) {
    std::vector<Seconds> medians;
    for (auto& each : bench::turns(pieces, turns, clock))
        medians.push_back(quantile(std::move(each), 0.5));
    return medians;
}

Seconds quantile(std::vector<Seconds> times, double part) {
    const auto index = static_cast<std::ptrdiff_t>(static_cast<double>(times.size()) * part);
    std::ranges::nth_element(times, times.begin() + index);
    return times.at(static_cast<std::size_t>(index));
}

std::string shown(Seconds time) {
    const char* unit = "s";
    double number = time.count();
    for (const char* smaller : {"ms", "us", "ns"}) {
        if (number >= 1) break;
        number *= 1000;
        unit = smaller;
    }
    char text[32];
    std::snprintf(text, sizeof text, "%.3g %s", number, unit);
    return text;
}

bool report(const std::string& figure, Seconds time, const std::string& yardstick,
            Seconds yardstickTime, double goal, const std::string& remark) {
    const double ratio = time / yardstickTime;
    std::printf("%-44s %9s | %-34s %9s | %5.2fx, goal %.2fx %s%s%s\n", figure.c_str(),
                shown(time).c_str(), yardstick.c_str(), shown(yardstickTime).c_str(), ratio, goal,
                ratio <= goal ? "reached" : "MISSED", remark.empty() ? "" : " | ", remark.c_str());
    std::fflush(stdout);
    return ratio <= goal;
}

}  // namespace vlm::bench
