// CardKey: a key pair whose private half opens what it is given, as a card would, but with OpenSSL.

#pragma once

#include <optional>
#include <string>

#include "services/hints/tokens.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {

class CardKey {
public:
    // "RSA-2048", "ED25519", or the name of a curve.
    explicit CardKey(const std::string& kind);

    const Bytes& publicInfo() const { return _publicInfo; }
    Bytes hash() const;
    // None when the card would refuse.
    std::optional<Secret> open(const OpenRequest& request) const;

private:
    std::optional<Secret> decrypt(const OpenRequest& request) const;
    std::optional<Secret> agree(const Bytes& point) const;

    KeyHandle _key;
    Bytes _publicInfo;
};

}  // namespace vlm::service
