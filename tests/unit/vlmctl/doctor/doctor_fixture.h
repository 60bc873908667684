// A patient whose files lie in a folder of the test, and whose parts answer as the test says.

#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "control_fixture.h"
#include "services/vlmctl/doctor/checks.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::control::doctor {

class DoctorTest : public ControlTest {
protected:
    DoctorTest() {
        patient.files = MachineFiles(folder.path());
        patient.answers = Answers{{{"Reader"}}, {{Card{"PIV", 2, 1}}}, std::size_t{1}};
        patient.account = "alice";
        patient.now = std::int64_t{1} << 40U;
    }

    // The only finding about this; a problem that says so when there is none, or more.
    static Finding about(const Findings& findings, const std::string& check) {
        const auto is = [&check](const Finding& each) { return each.check == check; };
        if (std::ranges::count_if(findings, is) != 1)
            return problem(check, "not exactly one finding is about it", {});
        return *std::ranges::find_if(findings, is);
    }

    test::TemporaryFolder folder;
    Patient patient;
};

MATCHER(IsWell, "") { return arg.verdict == Verdict::Ok && arg.remedy.empty(); }
MATCHER_P(Warns, words, "") {
    return arg.verdict == Verdict::Warning && arg.words.find(words) != std::string::npos &&
           !arg.remedy.empty();
}
MATCHER_P(IsAProblem, words, "") {
    return arg.verdict == Verdict::Problem && arg.words.find(words) != std::string::npos &&
           !arg.remedy.empty();
}

inline std::ostream& operator<<(std::ostream& stream, const Finding& finding) {
    return stream << static_cast<int>(finding.verdict) << " " << finding.check << ": "
                  << finding.words << " " << finding.remedy;
}

}  // namespace vlm::control::doctor
