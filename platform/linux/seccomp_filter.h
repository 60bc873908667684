// The system call filter: refuses what the tool never does, whichever file or argument it names.
//
// Refused for every thread, with an error number and not a signal: starting programs, sockets
// (of the unix family when it is not allowed, of every other one always), looking into or changing
// other processes, namespaces and mounts, the kernel and its modules, owners and modes of files,
// truncation by name (an open file can be cut), keystrokes put into a terminal. Everything else
// stays as it is. A call in the manner of another
// architecture ends the process: its numbers would slip past.
//
// Threads:  covers all threads of the process, present and future.
// Errors:   system error numbers.
// In tests: tests/integration/sandbox/confined_calls_test.cpp

#pragma once

namespace vlm::platform {

enum class UnixSockets { Refused, Allowed };

struct SeccompAnswer {
    int errorNumber = 0;         // 0 when the filter is in force
    bool kernelRefused = false;  // it was made but not taken: no process may filter its calls here
};

// Filters for good. The caller has set "no new privileges" before.
SeccompAnswer enterSeccompFilter(UnixSockets unixSockets);

}  // namespace vlm::platform
