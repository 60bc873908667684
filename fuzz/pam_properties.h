// What must hold for a login by PAM, whatever the application and the service say.

#pragma once

#include <cstdint>
#include <span>

namespace vlm::fuzz {

// The data is what they say, one after the other. Nobody gets in without the service's word, no
// error is passed over, and only text that is safe to show is shown.
bool pamConversationIsSound(std::span<const std::uint8_t> data);

}  // namespace vlm::fuzz
