// Tokens: the smart cards that are inserted, the identities on them, and the proof that a card
// holds a key.
//
// Shapes:    a token identifier is the token's PKCS#11 URI (RFC 7512: model, manufacturer, serial,
//            token). A public-key hash is SHA-256 over the DER SubjectPublicKeyInfo. Text that
//            comes from a card is made harmless here already: valid UTF-8, no control or
//            direction-changing characters, at most 256 characters.
// Threads:   the event loop's; answers are called there too, exactly once, never before the
//            asking call has returned.
// Blocking:  never; a card module that hangs is given up after a time limit, and costs only what
//            was asked of it.
// Errors:    a module that fails is one warning line in the log; the other tokens are listed.
// Behind it: services/hints/tokens/worker_tokens.h
// In tests:  tests/fakes/fake_tokens.h, tests/integration/tokens/

#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/types.h"
#include "services/hints/secret.h"

namespace vlm::service {

using platform::Bytes;

// A certificate on a token whose private key is there too. Where several certificates belong to
// one key, the one that is valid now, and of those the newest, stands for it.
struct Identity {
    Bytes publicKeyHash;
    Bytes publicKeyInfo;         // DER SubjectPublicKeyInfo
    std::string name;            // common name, else e-mail or principal name, else the label
    std::int64_t notBefore = 0;  // seconds since 1970-01-01 00:00:00 UTC
    std::int64_t notAfter = 0;
    bool canSign = false;  // key and certificate both allow signatures
    Bytes certificate;     // in DER; empty when it is too large to be told

    // Why nobody may log in with it, where the machine checks whom it trusts: a clause for people.
    // Empty when it may be used, and where nothing is checked.
    std::string distrust;

    bool validAt(std::int64_t seconds) const { return notBefore <= seconds && seconds <= notAfter; }
    bool operator==(const Identity&) const = default;
};

// How a token's wrap key opens what was wrapped with its public half. The numbers are those of the
// stored form.
enum class WrapScheme : std::uint8_t {
    RsaOaepSha256 = 1,  // OAEP, SHA-256 and MGF1 with SHA-256, no label
    RsaPkcs1 = 2,       // PKCS#1 v1.5, for a card that can do no other
    Ecdh = 3,           // ECDH with an ephemeral key
};

enum class PinState { Ready, FewTriesLeft, LastTry, Locked };

struct Token {
    std::string identifier;
    std::string name;        // its label, else its model, else its manufacturer
    bool hasPinPad = false;  // the reader asks for the PIN itself
    bool needsLogin = true;
    PinState pinState = PinState::Ready;
    std::vector<Identity> identities;  // sorted by hash, each hash once
    // The certificates without a key here, in DER: of issuers, as a rule. Some are left out where
    // there are many.
    std::vector<Bytes> otherCertificates;
    // The identity whose key can wrap: an RSA key that may decrypt, or an EC key that may derive.
    std::optional<Bytes> wrapKeyHash;
    WrapScheme wrapScheme = WrapScheme::RsaOaepSha256;  // the best that this key and card can do
    bool operator==(const Token&) const = default;
};

// What the card's wrap key is to open after it has signed, in the same login.
struct OpenRequest {
    Bytes wrapKeyHash;
    WrapScheme scheme = WrapScheme::RsaOaepSha256;
    Bytes
        sealed;  // RSA: what was encrypted; ECDH: the ephemeral point, uncompressed (SEC 1, 2.3.3)
    bool operator==(const OpenRequest&) const = default;
};

// A signature by one key of one token over a challenge, asked of the card with a PIN.
struct ProofRequest {
    std::string tokenIdentifier;
    Bytes publicKeyHash;
    Bytes challenge;  // what the card signs (SHA-256 and PKCS#1 v1.5 for RSA, ECDSA for EC)
    Secret pin;       // empty when the reader asks for it, or the token needs none
    std::optional<OpenRequest> open = {};
};

struct Proof {
    enum class Outcome {
        Signed,
        NoSuchToken,
        NoSuchKey,
        PinIncorrect,
        PinLocked,
        Cancelled,   // by the person at the reader's pad
        CardFailed,  // the card, the reader or the module failed, or ran out of time
    };
    Outcome outcome = Outcome::CardFailed;
    Bytes signature;  // DER for ECDSA
    PinState pinStateAfter = PinState::Ready;
    std::string reason;  // why it failed, for people; holds no secret

    // What the wrap key made of the request to open: the decrypted bytes, or the first coordinate
    // of the common point. None when nothing was asked, or it failed, which spoils no signature.
    std::shared_ptr<const Secret> opened = {};
    std::string whyNotOpened = {};
};

// When a listing has to be asked for again by who wants to know of every token. The numbers are
// those of a reply.
enum class LookAgain {
    OnCardEvent = 0,  // when a card or a reader comes or goes
    NowAndThen = 1,   // a token may come to a software module, which announces nothing
    Soon = 2,         // a card is being read; it is not in the listing yet
};

class Tokens {
public:
    virtual ~Tokens() = default;

    // The inserted tokens, sorted by identifier.
    virtual void list(std::function<void(std::vector<Token>)> answer) = 0;

    // As of the last listing.
    virtual LookAgain lookAgain() const = 0;

    // Logs in with the PIN exactly once and lets the key sign the challenge. The caller checks the
    // signature: a module is foreign code and is not believed.
    virtual void prove(ProofRequest request, std::function<void(Proof)> answer) = 0;
};

}  // namespace vlm::service
