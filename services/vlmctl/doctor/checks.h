// What the doctor looks at. Each group is a function of the machine's files, and of what its
// running parts answer; without answers, as for a disk in a folder, only the files are looked at.
//
// Threads: one. Blocking: for the disk. Errors: are findings.
// In tests: tests/unit/vlmctl/doctor/, tests/integration/vlmctl/doctor_test.cpp

#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "services/vlmctl/doctor/answers.h"
#include "services/vlmctl/doctor/finding.h"
#include "services/vlmctl/doctor/machine_files.h"

namespace vlm::control::doctor {

struct Patient {
    MachineFiles files;
    std::optional<Answers> answers;  // of this machine only
    std::string account;             // the caller's
    bool isRoot = false;
    std::string runtimeFolder;  // of the caller's session; empty without one
    std::int64_t now = 0;       // seconds since 1970-01-01 00:00:00 UTC
};

Findings checkClock(const Patient& patient);
Findings checkReaders(const Patient& patient);
Findings checkModules(const Patient& patient);
Findings checkService(const Patient& patient);
Findings checkDesktop(const Patient& patient);
Findings checkPam(const Patient& patient);
Findings checkKeyring(const Patient& patient);
Findings checkSettings(const Patient& patient);
Findings checkTrust(const Patient& patient);

}  // namespace vlm::control::doctor
