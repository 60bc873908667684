// The padding of RSA-OAEP (RFC 8017, 7.1.2), taken off what a card's bare RSA operation made.

#pragma once

#include <optional>

#include "services/hints/secret.h"

namespace vlm::service {

// What was padded with SHA-256, MGF1 with SHA-256 and no label; none for a block that was not. How
// long it takes tells nothing about the block. Leaves nothing in OpenSSL's error queue.
std::optional<Secret> withoutOaepPadding(const Secret& block, std::size_t modulusBytes);

}  // namespace vlm::service
