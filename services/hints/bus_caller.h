// KnownCallers: who the callers on one bus are, as that bus says.
//
// What was said of a connection is kept, as it never changes and no other connection gets its name:
// who sends at rate makes this program ask once. While it waits for such an answer it has to take
// in all that was sent before.
//
// Threads:   one. Blocking: asks the bus about a connection that it does not know.
// Errors:    a caller that is gone already is not known.
// In tests:  tests/integration/service/bus_server_test.cpp

#pragma once

#include <systemd/sd-bus.h>

#include <cstddef>
#include <map>
#include <optional>
#include <string>

#include "services/hints/caller.h"

namespace vlm::service {

class KnownCallers {
public:
    // Then all are forgotten, and asked about anew.
    static constexpr std::size_t kMost = 256;

    std::optional<Caller> senderOf(sd_bus_message* call);

private:
    std::map<std::string, Caller, std::less<>> _known;
};

}  // namespace vlm::service
