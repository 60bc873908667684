// Whether a point may be given to a card's EC key.

#pragma once

#include <cstdint>
#include <span>

namespace vlm::service {

// Whether the point (SEC 1, 2.3.3, uncompressed) is one of the curve that the key is on, and of its
// large group: on another curve a card would give its private key away, piece by piece. Leaves
// nothing in OpenSSL's error queue.
bool isPointForKey(std::span<const std::uint8_t> point,
                   std::span<const std::uint8_t> publicKeyInfo);

}  // namespace vlm::service
