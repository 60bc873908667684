// What polkit answers to CheckAuthorization, as its D-Bus reference describes the reply: (bba{ss}).
// Read by the program that asks for itself and by the service that asks about its callers.

#pragma once

#include <systemd/sd-bus.h>

#include <string>

namespace vlm::platform {

inline constexpr const char* kAuthority = "org.freedesktop.PolicyKit1";
inline constexpr const char* kAuthorityObject = "/org/freedesktop/PolicyKit1/Authority";
inline constexpr const char* kAuthorityInterface = "org.freedesktop.PolicyKit1.Authority";
inline constexpr unsigned kAllowUserInteraction = 1;

struct PolkitVerdict {
    bool isAuthorized = false;
    bool isChallenge = false;  // a person could be asked, and was not
    bool isDismissed = false;  // by the person
    std::string keptId;        // of a right that is kept for a while; empty for one that is not
};

// Below zero, as sd-bus has it, for what is no such answer.
int readPolkitVerdict(sd_bus_message* answer, PolkitVerdict& verdict);

}  // namespace vlm::platform
