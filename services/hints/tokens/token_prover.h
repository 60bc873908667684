// One proof: log in to a token with a PIN, once, and let one of its keys sign a challenge, and
// another one open something. Whatever happens, the token is logged out and the session closed at
// the end of the prover's life.

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/key_opener.h"
#include "services/hints/tokens/pkcs11_module.h"
#include "services/hints/tokens/private_keys.h"

namespace vlm::service {

class TokenProver {
public:
    // What is given must outlive the prover.
    TokenProver(const Pkcs11Module& module, const SlotToken& slotToken,
                const TokenObjects& objects);
    ~TokenProver();
    TokenProver(const TokenProver&) = delete;
    TokenProver& operator=(const TokenProver&) = delete;

    // Called once.
    Proof prove(ProofRequest& request);

    // What the request wants opened; after a proof that was signed.
    Opening open(ProofRequest& request);

private:
    std::optional<Proof> login(Secret& pin);
    Proof signWithOneOf(const std::vector<PrivateKey>& keys, const CertificateFacts& facts,
                        ProofRequest& request);
    CK_RV sign(const PrivateKey& key, const CertificateFacts& facts, ProofRequest& request,
               Bytes& signature) const;
    Proof failed(CK_RV result, const std::string& what) const;
    PinState pinState() const;

    const Pkcs11Module& _module;
    const SlotToken& _slotToken;
    const TokenObjects& _objects;
    Token _token;
    std::optional<Pkcs11Session> _session;
    bool _isLoggedIn = false;
};

}  // namespace vlm::service
