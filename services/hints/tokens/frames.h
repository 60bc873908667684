// Messages between the service and a card worker on a stream socket: a length (32 bits, little
// endian), and that many bytes.

#pragma once

#include <cstdint>
#include <optional>
#include <span>

#include "platform/types.h"
#include "services/hints/secret.h"

namespace vlm::service {

using platform::Bytes;

inline constexpr std::size_t kMostFrameBytes = std::size_t{16} << 20U;

// Read the next frame whole, waiting for it; none at the end of the stream, or for a longer frame.
std::optional<Bytes> readFrame(int socket);
std::optional<Secret> readSecretFrame(int socket, std::size_t most);

// Writes a frame, waiting for room; false when the other side is gone.
bool writeFrame(int socket, std::span<const std::uint8_t> content);

// Writes a frame and, when there is a secret, one with it, without waiting and without a copy of
// the secret; false when it does not go out whole.
bool sendFrames(int socket, std::span<const std::uint8_t> content, const Secret* secret);

// Puts frames together out of what comes in piece by piece.
class FrameAssembler {
public:
    enum class State { Incomplete, Complete, TooLong };

    State add(std::span<const std::uint8_t> piece);

    // The first complete frame; what follows it stays.
    Bytes take();

private:
    State state() const;
    std::size_t announced() const;

    Bytes _received;
};

}  // namespace vlm::service
