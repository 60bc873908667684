// Which of many hashes come more than once: found in a small part of the memory and the time that
// a table of them takes, but not for certain.
//
// Errors: none.

#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace vlm::platform {

// What no SecretHash answers.
inline constexpr std::uint32_t kNoHash = 0;

// Puts kNoHash in the place of hashes that come only once. Every hash that comes more than once is
// kept, and a few of the others. Answers how many places keep theirs.
std::size_t keepRepeatedHashes(std::span<std::uint32_t> hashes);

}  // namespace vlm::platform
