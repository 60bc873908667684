// What the machine's trust modules call trusted, and how a worker process tells it.
//
// Such a module is foreign code, as a card's is: it is loaded by a worker, which reads it, writes
// one frame and ends. What it says is believed, since that is what it is configured for; that it is
// well formed is not.
//
// Threads: any.
// In tests: tests/unit/services/tokens/machine_anchors_test.cpp, tests/integration/tokens/

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "platform/types.h"

namespace vlm::service {

// In DER.
struct MachineAnchors {
    std::vector<platform::Bytes> trusted;
    std::vector<platform::Bytes> distrusted;  // also where somebody else trusts them

    bool operator==(const MachineAnchors&) const = default;
};

inline constexpr std::size_t kMostAnchors = 4096;  // of one module, of each kind
inline constexpr std::size_t kMostAnchorBytes = std::size_t{16} << 10U;

// What one module holds; what is out of bounds is left out.
std::optional<platform::Bytes> encodeAnchors(const MachineAnchors& anchors);
std::optional<MachineAnchors> decodeAnchors(std::span<const std::uint8_t> message);

}  // namespace vlm::service
