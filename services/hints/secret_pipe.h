// Secrets on their way through the bus: in a pipe that a message carries, so that the bus itself
// never has them in its memory.
//
// Ownership: the pipe is closed with the last copy of its endpoint.
// Threads:   any. Blocking: never; who writes has written before the message is sent.
// Errors:    none; a secret is at most kMostSecretBytes long and never empty.
// In tests:  tests/unit/services/secret_pipe_test.cpp

#pragma once

#include <optional>

#include "platform/endpoint.h"
#include "services/hints/secret.h"

namespace vlm::service {

inline constexpr std::size_t kMostSecretBytes = 4096;

// The reading end of a pipe that holds the secret and is closed for writing.
std::optional<platform::Endpoint> pipeHolding(const Secret& secret);

// What is in the pipe now. None for anything but a pipe that holds a secret, all of it.
std::optional<Secret> secretIn(const platform::Endpoint& pipe);

}  // namespace vlm::service
