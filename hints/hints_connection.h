// How the hints service is reached: whom to talk to, and how text gets into a message.
//
// Threads:  any; there is no state.
// Blocking: no; a connection is only made ready.
// Errors:   a service that is not there shows in the exchange.
// In tests: tests/unit/hints/hints_connection_test.cpp

#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "platform/message.h"
#include "platform/named_service_ipc.h"
#include "platform/string.h"
#include "platform/types.h"

namespace vlm::hints {

inline constexpr std::string_view kDaemonService = "org.vlm.token.hints.daemon";
inline constexpr std::string_view kAgentService = "org.vlm.token.hints.agent";

// A user id as it is sent and logged: nobody is -1.
std::int64_t userIdNumber(platform::UserId userId);

// The user at the console; kNobody when there is none, and for root.
platform::UserId getUidForAgent();

// A new, resumed connection to the daemon or to the user's own instance. Without `forceDaemon` the
// daemon is chosen when nobody is at the console and for a process that runs as root.
std::unique_ptr<platform::Connection> setupConnection(platform::Connection::EventHandler handler,
                                                      bool forceDaemon);

// Puts the text into the message as UTF-8. False, with the message unchanged, when it cannot be
// converted.
bool setStringToMsgObject(platform::Message* message, std::string_view key,
                          const platform::String& string);

}  // namespace vlm::hints
