// Why an exchange with a named service failed: what that means for the connection, and the
// sentence for the person who waits for the reply.
//
// Threads: any. Shapes: a reason is a text of the system or of the other end; it is escaped and
// bounded here.

#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/message.h"
#include "platform/named_service_ipc.h"

namespace vlm::platform {

struct ExchangeFailure {
    std::string sentence;
    std::optional<ConnectionEvent> event;

    // The reply that stands for the one that did not come.
    Message reply() const;
};

// The ways in which exchanges with one service fail.
class ExchangeFailures {
public:
    ExchangeFailures(std::string service, ServiceScope scope);

    ExchangeFailure notResumed() const;
    ExchangeFailure noBus(std::string_view reason) const;
    ExchangeFailure busWentAway(std::string_view reason) const;
    ExchangeFailure cannotBeSent(std::string_view reason) const;
    ExchangeFailure unreadableReply(std::string_view reason) const;

    // The bus or the service answered with an error instead of a reply.
    ExchangeFailure errorReply(std::string_view name, std::string_view message) const;

private:
    std::string sentence(std::string_view problem, std::string_view reason,
                         std::string_view remedy) const;

    const std::string _service;
    const ServiceScope _scope;
};

}  // namespace vlm::platform
