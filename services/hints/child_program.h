// A program that this service runs and talks to: its standard input and output are one socket.
//
// The program leads a session of its own, without a terminal; it inherits nothing but that socket
// and is killed with this process.
//
// Blocking: no. Errors: a sentence's end that says why it does not run.

#pragma once

#include <sys/types.h>

#include <optional>
#include <string>
#include <vector>

#include "platform/linux/file_descriptor.h"
#include "services/hints/outcome.h"

namespace vlm::service {

struct ProgramToRun {
    std::string path;
    std::vector<std::string> environment;  // all of it, "NAME=value"
    std::optional<uid_t> user;             // whom it runs as, with that user's own group only
    gid_t group = 0;
};

class ChildProgram {
public:
    static Outcome<ChildProgram> start(const ProgramToRun& program);

    ChildProgram(ChildProgram&& other) noexcept;
    ChildProgram& operator=(ChildProgram&& other) noexcept;
    ChildProgram(const ChildProgram&) = delete;
    ChildProgram& operator=(const ChildProgram&) = delete;

    // Ends it at once if it still runs.
    ~ChildProgram();

    // Reading never waits.
    int socket() const { return _socket.get(); }

private:
    ChildProgram(pid_t process, platform::FileDescriptor socket);

    pid_t _process = -1;
    platform::FileDescriptor _socket;
};

}  // namespace vlm::service
