// The process of one card worker: started, spoken to through a socket, ended.

#pragma once

#include <sys/types.h>

#include <chrono>
#include <list>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/tokens/event_source.h"

namespace vlm::service {

// A file descriptor; closed at the end of its life.
class Descriptor {
public:
    Descriptor() = default;
    explicit Descriptor(int number) : _number(number) {}
    Descriptor(Descriptor&& other) noexcept;
    Descriptor& operator=(Descriptor&& other) noexcept;
    ~Descriptor();

    int get() const { return _number; }
    void close();

private:
    int _number = -1;
};

struct WorkerCommand {
    std::vector<std::string> arguments;    // the program's path first
    std::vector<std::string> environment;  // "NAME=value"; goes before this process's own
};

struct WorkerProcess {
    pid_t pid = 0;
    Descriptor handle;  // becomes readable when the process has ended
    Descriptor socket;
};

// Starts the program with the other end of the socket as descriptor 3 and standard error as its
// only other open file. It may gain no privileges and dies when this process does. None when it
// cannot be started; a program that is not there shows as a socket that closes.
std::optional<WorkerProcess> startWorker(const WorkerCommand& command);

// Takes processes that are not needed any more, and sees to it that none is left behind.
class WorkerGraveyard {
public:
    explicit WorkerGraveyard(sd_event* event) : _event(event) {}
    ~WorkerGraveyard();
    WorkerGraveyard(const WorkerGraveyard&) = delete;
    WorkerGraveyard& operator=(const WorkerGraveyard&) = delete;

    void bury(WorkerProcess process);      // at once
    void letLeave(WorkerProcess process);  // of itself, its socket being closed

private:
    struct Grave {
        pid_t pid;
        Descriptor handle;
        EventSource ended;
    };

    void wait(WorkerProcess process);

    sd_event* _event;
    std::list<Grave> _graves;
};

}  // namespace vlm::service
