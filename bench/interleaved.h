// Measures pieces of work side by side. Machines are noisy, and speed up and slow down over
// seconds; so the pieces take turns, and what counts is the ratio of their medians.
//
// Threads: one.

#pragma once

#include <chrono>
#include <functional>
#include <string>
#include <vector>

namespace vlm::bench {

struct Work {
    std::string name;
    std::function<void()> run;
    std::size_t times = 1;  // in one turn, so that a turn is long enough for the clock
};

// Processor time leaves out what other programs do on a busy machine, but counts only what this
// thread does itself.
enum class Clock { Processor, Wall };

// The times of one run of each piece, one for each of that many turns.
std::vector<std::vector<std::chrono::duration<double>>> turns(const std::vector<Work>& pieces,
                                                              std::size_t count, Clock clock);

// The median time of one run of each piece, after that many turns.
std::vector<std::chrono::duration<double>> medianTimes(const std::vector<Work>& pieces,
                                                       std::size_t turns,
                                                       Clock clock = Clock::Processor);

// The time that this part of all runs stayed below; the half of them gives the median.
std::chrono::duration<double> quantile(std::vector<std::chrono::duration<double>> times,
                                       double part);

// Keeps the compiler from leaving out work whose result nobody looks at.
template <typename Value>
void keep(const Value& value) {
    asm volatile("" : : "r"(&value) : "memory");
}

// A line for people, of a figure, its yardstick in the same run and the goal for their ratio.
// Whether the goal was reached.
bool report(const std::string& figure, std::chrono::duration<double> time,
            const std::string& yardstick, std::chrono::duration<double> yardstickTime, double goal,
            const std::string& remark = {});

// "1.23 us" and the like.
std::string shown(std::chrono::duration<double> time);

}  // namespace vlm::bench
