// What storing an unlock key answers in a test, and for which hashes it was asked.

#pragma once

#include <optional>
#include <vector>

#include "platform/types.h"

namespace vlm::fakes {

struct FakeUnlockKey {
    platform::Status status = platform::kSuccess;
    std::optional<platform::Error> error;
    std::vector<std::optional<platform::Bytes>> asked;
};

FakeUnlockKey& unlockKey();

}  // namespace vlm::fakes
