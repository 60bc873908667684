// Agent: the program as the desktop starts it, without arguments. It offers to pair a card, once,
// and ends.
//
// Ownership: the application keeps its handler, and through it the agent, as long as the process.
// Threads:   events come on the main queue; a bind ends on any thread.
// Blocking:  an event reads the switches of the dialog; nothing waits for a person or a card.
// Errors:    none: every end has the status 0, and the log and the user's alert say how it went.
// In tests:  tests/unit/tool/agent_test.cpp

#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "bind/bind_operation.h"
#include "platform/application.h"

namespace vlm {

class Agent : public std::enable_shared_from_this<Agent> {
public:
    explicit Agent(PairingDialogMaker makeDialog) : _makeDialog(std::move(makeDialog)) {}

    void handleEvent(const std::string& notification);

private:
    std::shared_ptr<BindOperation> startedBind(const std::string& notification);
    void finish(BindResult result, const std::optional<platform::Error>& error);

    const PairingDialogMaker _makeDialog;

    std::mutex _bindLock;  // for everything below
    std::shared_ptr<BindOperation> _runningBind;
    std::unique_ptr<platform::Application::Transaction> _transaction;
};

// The whole life of an agent; the process's exit status.
int runAgent();

}  // namespace vlm
