// ProbeTest: the base of tests that let a confined program try something.
//
// A test has a home folder of its own, with the folders that the tool may use, and a folder
// elsewhere that the same user may use but the tool may not.

#pragma once

#include <gtest/gtest.h>
#include <linux/landlock.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

// The kernel's version of Landlock; 0 when it has none.
inline int landlockVersion() {
    const long version =
        syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
    return version > 0 ? static_cast<int>(version) : 0;
}

// What a probe printed.
struct Report {
    std::optional<int> result;  // error number of the attempt; none when it did not come that far
    std::optional<int> status;  // how the probe ended
    std::string refusal;        // why it could not confine itself
    std::vector<std::string> log;
    std::string errors;
};

class ProbeTest : public ::testing::Test {
protected:
    ProbeTest() {
        std::filesystem::create_directories(home());
        std::filesystem::create_directories(elsewhere());
        std::filesystem::create_directories(runtime());
    }

    std::filesystem::path home() const { return _folder.path() / homeName; }
    std::filesystem::path elsewhere() const { return _folder.path() / "elsewhere"; }
    std::filesystem::path runtime() const { return _folder.path() / "runtime"; }
    const TemporaryFolder& folder() const { return _folder; }

    // A file with three bytes in it.
    std::filesystem::path fileIn(const std::filesystem::path& place) const {
        return _folder.write(place.lexically_relative(_folder.path()) / "file", "abc");
    }

    // The probe's command line: its options, then what it is to try.
    std::vector<std::string> command(const std::vector<std::string>& attempt) const {
        std::vector<std::string> all{program};
        all.insert(all.end(), probeOptions.begin(), probeOptions.end());
        all.insert(all.end(), attempt.begin(), attempt.end());
        return all;
    }

    Child::Options options() const {
        Child::Options options;
        options.environment = {
            {"HOME", home().string()},
            {"XDG_RUNTIME_DIR", runtime().string()},
            {"XDG_CACHE_HOME", cacheHome},
            {"XDG_CONFIG_HOME", configurationHome},
            // At its end the leak checker looks into the process with ptrace, which is denied.
            {"ASAN_OPTIONS", "detect_leaks=0"},
        };
        return options;
    }

    Report probe(const std::vector<std::string>& attempt) const {
        return reportOf(run(command(attempt), options()));
    }

    // The same without confinement.
    Report probeOpen(const std::vector<std::string>& attempt) const {
        std::vector<std::string> all{program, "--open"};
        all.insert(all.end(), attempt.begin(), attempt.end());
        return reportOf(run(std::move(all), options()));
    }

    static Report reportOf(const Ended& ended) {
        Report report;
        report.status = ended.status;
        report.errors = ended.errors;
        std::string_view rest = ended.output;
        while (!rest.empty()) {
            const auto end = std::min(rest.find('\n'), rest.size());
            takeLine(rest.substr(0, end), report);
            rest.remove_prefix(std::min(end + 1, rest.size()));
        }
        return report;
    }

    std::string homeName = "home";
    std::optional<std::string> cacheHome;          // XDG_CACHE_HOME
    std::optional<std::string> configurationHome;  // XDG_CONFIG_HOME
    std::string program = SANDBOX_PROBE;
    std::vector<std::string> probeOptions;

private:
    static void takeLine(std::string_view line, Report& report) {
        const auto after = [&](std::string_view word) { return line.substr(word.size()); };
        if (line.starts_with("log: ")) report.log.emplace_back(after("log: "));
        if (line.starts_with("refused: ")) report.refusal = after("refused: ");
        if (line.starts_with("result: ")) {
            const auto digits = after("result: ");
            int number = 0;
            std::from_chars(digits.data(), digits.data() + digits.size(), number);
            report.result = number;
        }
    }

    TemporaryFolder _folder;
};

}  // namespace vlm::test
