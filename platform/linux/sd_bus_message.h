// A keyed dictionary on the bus: `a{sv}`, in the order in which the keys were set.
//
// Shapes:    unsigned 64-bit `t`, signed 64-bit `x`, text `s`, bytes `ay`, endpoint `h`.
// Ownership: endpoints are duplicated both ways; each side closes its own.
// Errors:    false (none), and a sentence for people in `reason`.
// Secrets:   a bus message that is written or read here is marked as sensitive, so that sd-bus
//            wipes it, since a PIN may travel in it.
// In tests:  tests/integration/linux/sd_bus_message_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <optional>
#include <string>
#include <vector>

#include "platform/message.h"

namespace vlm::platform {

// The bounds of a dictionary that somebody else wrote.
inline constexpr std::size_t kMostDictionaryEntries = 64;
inline constexpr std::size_t kMostDictionaryKeyBytes = 64;
inline constexpr std::size_t kMostDictionaryBytes = std::size_t{16} << 20U;  // keys and values

struct ReadDictionary {
    Message message;
    std::vector<std::string> foreignKeys;   // left out: their values are of none of our types
    std::vector<std::string> repeatedKeys;  // of several entries with one key the last counts
};

// Reads the dictionary that is the whole content of a message. None when the content is something
// else or exceeds the bounds.
std::optional<ReadDictionary> readDictionary(sd_bus_message* from, std::string& reason);

// Appends the dictionary to a message under construction. After a failure the message is incomplete
// and must not be sent.
bool appendDictionary(sd_bus_message* to, const Message& dictionary, std::string& reason);

}  // namespace vlm::platform
