// The private keys of a token, in a session that is logged in, and the logging in.

#pragma once

#include <vector>

#include "services/hints/secret.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/pkcs11_module.h"

namespace vlm::service {

struct PrivateKey {
    CK_OBJECT_HANDLE handle;
    bool alwaysAuthenticate;  // wants the PIN once more for each use
    SameKey sameKey;
};

// More keys than these are not tried for one hash.
inline constexpr std::size_t kMostKeysTried = 4;

// The PIN is handed over as it is, or not at all where the reader asks for it.
CK_RV login(const Pkcs11Session& session, CK_USER_TYPE user, Secret& pin, bool hasPinPad);

// What is known of the identity with the hash; null when the token has none.
const CertificateFacts* factsOf(const TokenObjects& objects, const Bytes& hash);

// The keys that can be the one behind the hash, the surest first.
std::vector<PrivateKey> privateKeysOf(const Pkcs11Session& session, const TokenObjects& objects,
                                      const Bytes& hash);

}  // namespace vlm::service
