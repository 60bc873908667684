// Messages between the service and a card worker on a stream socket: a length (32 bits, little
// endian), and that many bytes.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <utility>

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

enum class FrameState { Incomplete, Complete, TooLong };

// Puts frames together out of what comes in piece by piece.
class FrameAssembler {
public:
    FrameState add(std::span<const std::uint8_t> piece);

    // How many bytes are known to be missing. Who reads no more than these leaves the next frame,
    // which may hold a secret, untouched.
    std::size_t missing() const;

    // The first complete frame; what follows it stays.
    Bytes take();

private:
    FrameState state() const;
    std::size_t announced() const;

    Bytes _received;
};

// Puts one frame together in the memory of a secret.
class SecretAssembler {
public:
    explicit SecretAssembler(std::size_t most) : _most(most) {}

    // Where the next bytes of the frame belong; not empty while it is incomplete.
    std::span<std::uint8_t> room();
    // That many bytes were put there.
    FrameState filled(std::size_t size);

    // The complete frame.
    Secret take() { return std::move(_secret); }

private:
    static constexpr std::size_t kHeader = 4;

    std::size_t _most;
    std::array<std::uint8_t, kHeader> _header{};
    Secret _secret;
    std::size_t _received = 0;  // with the header
};

}  // namespace vlm::service
