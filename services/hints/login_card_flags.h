// What the service says of the card to log in with, beside its names: bits of one number.

#pragma once

#include <cstdint>

namespace vlm::service {

enum class LoginCardFlag : std::uint8_t {
    PinPad = 1,  // the reader asks for the PIN itself
    FewTriesLeft = 2,
    LastTry = 4,
    CardRequired = 8,  // the account has no other way in
};

}  // namespace vlm::service
