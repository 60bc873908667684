// The unlock key that opens the login keyring after a login with the card.

#include "bind/bind_operation.h"
#include "platform/token_framework.h"

namespace vlm {

// A pairing stands without an unlock key, so callers take this refusal for a warning.
platform::Status BindOperation::storeUnlockKey(const OptionalHash&, ErrorPlace error) {
    if (error)
        *error = platform::Error{std::string(platform::VLErrorDomain), kRefused,
                                 "This version cannot store an unlock key yet."};
    return kRefused;
}

}  // namespace vlm
