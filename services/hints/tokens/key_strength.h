// How strong a key must be to be relied on: of about the same strength, about 112 bits.

#pragma once

namespace vlm::service {

inline constexpr int kSmallestRsaKey = 2048;
inline constexpr int kSmallestCurve = 224;

}  // namespace vlm::service
