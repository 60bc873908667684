// Opening: what a token's wrap key makes of something that was sealed with its public half, in a
// session that is logged in.

#pragma once

#include <string>

#include "services/hints/secret.h"
#include "services/hints/tokens.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/pkcs11_module.h"
#include "services/hints/tokens/private_keys.h"

namespace vlm::service {

struct Opening {
    Secret opened;       // empty when it failed
    std::string whyNot;  // for people; holds no secret
};

class KeyOpener {
public:
    // What is given must outlive the opener.
    KeyOpener(const Pkcs11Module& module, const SlotToken& slotToken, const TokenObjects& objects,
              const Pkcs11Session& session);

    // The PIN is for a key that wants it for each use.
    Opening open(const OpenRequest& request, Secret& pin) const;

private:
    CK_RV openWith(const PrivateKey& key, const OpenRequest& request, Secret& pin,
                   Secret& opened) const;
    CK_RV decryptOaep(const PrivateKey& key, const Bytes& sealed, Secret& pin,
                      Secret& opened) const;
    CK_RV decrypt(CK_MECHANISM mechanism, const PrivateKey& key, Bytes sealed, Secret& pin,
                  Secret& opened) const;
    CK_RV derive(const PrivateKey& key, Bytes point, Secret& pin, Secret& opened) const;

    const Pkcs11Module& _module;
    const Pkcs11Session& _session;
    const TokenObjects& _objects;
    const CK_SLOT_ID _slot;
    const std::string _cardName;
    const bool _hasPinPad;
};

}  // namespace vlm::service
