// Exchange: one request to the hints service and its reply, within a time.
//
// A function, so that tests answer in the service's place.
//
// Threads: the caller's; none is started. Blocking: until the reply is there or the time is over,
//          also where the bus itself hangs.
// Errors:  none is every failure but a refusal, which is a reply.
// In tests: tests/integration/pam/

#pragma once

#include <chrono>
#include <functional>
#include <optional>
#include <string>

#include "platform/message.h"

namespace vlm::pam {

using Exchange = std::function<std::optional<platform::Message>(const platform::Message& request,
                                                                std::chrono::seconds patience)>;

// With the daemon on the bus of that address. Each request has a connection of its own, which ends
// with it: a process that lets people in has no use for one that stays.
Exchange exchangeOn(const std::string& busAddress);

}  // namespace vlm::pam
