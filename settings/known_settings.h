// What there is to set, and where a setting's value can come from.

#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string_view>

namespace vlm {

// The preferences domain of everything about smart cards.
inline constexpr std::string_view kSmartcardDomain = "org.vlm.smartcard";

struct KnownSetting {
    std::string_view key;
    std::int32_t defaultValue;
    bool obeysManagement;  // whether a forced value counts
    // What the numbers from 0 on are called; a switch, which is off or on, has no other words.
    std::span<const std::string_view> choices = {};
};

// What becomes of a session when the card is pulled with which it was logged in.
inline constexpr std::array<std::string_view, 3> kRemovalActions = {"none", "lock", "logout"};

// A machine where nobody has decided anything lets people use their cards. Whether users without a
// card may log in is always the machine's own decision: a fleet's rule must not lock out the one
// who mends the machine.
inline constexpr std::array kKnownSettings = {
    KnownSetting{"allowSmartCard", 1, true},
    KnownSetting{"UserPairing", 1, true},
    KnownSetting{"oneCardPerUser", 0, true},
    KnownSetting{"checkCertificateTrust", 0, true},
    KnownSetting{"useLocalOd", 0, true},
    KnownSetting{"enforceSmartCard", 0, true},
    KnownSetting{"allowUnmappedUsers", 0, false},
    KnownSetting{"tokenRemovalAction", 0, true, kRemovalActions},
};

}  // namespace vlm
