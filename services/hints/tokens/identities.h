// Which of a token's certificates are identities: a rule over what the token shows, without a
// card in it.
//
// Private keys are mostly hidden until someone logs in. So a public-key object with the
// certificate's id and key is taken as a witness of the private one; and where a token that needs
// a login shows no key object at all, its certificates are believed until the login proves them.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/certificate.h"

namespace vlm::service {

struct CertificateObject {
    Bytes id;
    std::string label;  // harmless already
    CertificateFacts facts;
    Bytes der;
};

struct KeyObject {
    bool isPrivate = false;
    KeyKind kind = KeyKind::Rsa;
    Bytes id;
    Bytes publicPart;  // RSA: modulus; EC: point; as the module gives it, empty when it tells none
    bool signs = false;  // private: may sign; public: may verify
    bool wraps = false;  // private: may decrypt; public: may encrypt; EC: may derive
};

// What the token's wrap keys could be asked to do.
struct WrapMechanisms {
    bool oaep = false;  // or the bare operation, whose padding can be taken off here
    bool pkcs1 = false;
    bool ecdh = false;
};

struct TokenObjects {
    std::vector<CertificateObject> certificates;
    std::vector<KeyObject> keys;
    bool showsKeys = false;  // key objects of any kind, also of kinds that are not in `keys`
    WrapMechanisms wrapMechanisms;
};

// Whether the object holds the certificate's key.
enum class SameKey { Yes, No, Untold };
SameKey sameKey(const KeyObject& key, const CertificateFacts& certificate);

// Fills in the token's identities, its wrap key and its other certificates, as they are at the
// given time.
void addIdentities(const TokenObjects& objects, std::int64_t now, Token& token);

}  // namespace vlm::service
