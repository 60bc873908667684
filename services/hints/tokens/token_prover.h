// One proof: log in to a token with a PIN, once, and let one of its keys sign a challenge. Whatever
// happens, the token is logged out and the session closed at the end.

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/pkcs11_module.h"

namespace vlm::service {

class TokenProver {
public:
    // What is given must outlive the prover.
    TokenProver(const Pkcs11Module& module, const SlotToken& slotToken,
                const TokenObjects& objects);

    Proof prove(ProofRequest& request);

private:
    struct PrivateKey {
        CK_OBJECT_HANDLE handle;
        bool alwaysAuthenticate;
        SameKey sameKey;
    };

    std::optional<Proof> login(const Pkcs11Session& session, Secret& pin);
    std::vector<PrivateKey> keysOf(const Pkcs11Session& session, const Bytes& hash) const;
    Proof signWithOneOf(const Pkcs11Session& session, const std::vector<PrivateKey>& keys,
                        const CertificateFacts& facts, ProofRequest& request);
    CK_RV sign(const Pkcs11Session& session, const PrivateKey& key, const CertificateFacts& facts,
               ProofRequest& request, Bytes& signature) const;
    const CertificateFacts* factsOf(const Bytes& hash) const;
    Proof failed(CK_RV result, const std::string& what) const;
    PinState pinState() const;

    const Pkcs11Module& _module;
    const SlotToken& _slotToken;
    const TokenObjects& _objects;
    Token _token;
};

}  // namespace vlm::service
