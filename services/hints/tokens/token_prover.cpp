#include "services/hints/tokens/token_prover.h"

#include <utility>

#include "platform/text.h"
#include "services/hints/tokens/raw_signature.h"
#include "services/hints/tokens/signature.h"
#include "services/hints/tokens/token_reader.h"

namespace vlm::service {
namespace {

using Outcome = Proof::Outcome;

constexpr std::size_t kMostSignatureBytes = 4096;  // an RSA key of 32768 bits

Outcome outcomeOf(CK_RV result) {
    switch (result) {
        case CKR_OK:
            return Outcome::Signed;
        case CKR_PIN_INCORRECT:
        case CKR_PIN_INVALID:
        case CKR_PIN_LEN_RANGE:
            return Outcome::PinIncorrect;
        case CKR_PIN_LOCKED:
            return Outcome::PinLocked;
        case CKR_CANCEL:
        case CKR_FUNCTION_CANCELED:
            return Outcome::Cancelled;
        case CKR_TOKEN_NOT_PRESENT:
        case CKR_DEVICE_REMOVED:
        case CKR_SLOT_ID_INVALID:
            return Outcome::NoSuchToken;
        default:
            return Outcome::CardFailed;
    }
}

std::string pinSentence(PinState state) {
    switch (state) {
        case PinState::Ready:
            return "";
        case PinState::FewTriesLeft:
            return "; few tries are left";
        case PinState::LastTry:
            return "; one try is left";
        case PinState::Locked:
            return "; it is locked now";
    }
    return "";
}

}  // namespace

TokenProver::TokenProver(const Pkcs11Module& module, const SlotToken& slotToken,
                         const TokenObjects& objects)
    : _module(module), _slotToken(slotToken), _objects(objects), _token(describeToken(slotToken)) {}

Proof TokenProver::prove(ProofRequest& request) {
    const CertificateFacts* facts = factsOf(_objects, request.publicKeyHash);
    if (facts == nullptr)
        return {Outcome::NoSuchKey,
                {},
                _token.pinState,
                "the card \"" + _token.name + "\" has no such identity"};
    if (_token.pinState == PinState::Locked)
        return {Outcome::PinLocked,
                {},
                PinState::Locked,
                "the PIN of the card \"" + _token.name + "\" is locked"};

    _session = _module.openSession(_slotToken.slot);
    if (!_session) return failed(CKR_GENERAL_ERROR, "opened no session");
    if (auto refused = login(request.pin)) return std::move(*refused);
    _isLoggedIn = true;
    const auto keys = privateKeysOf(*_session, _objects, request.publicKeyHash);
    if (keys.empty())
        return {Outcome::NoSuchKey,
                {},
                pinState(),
                "the card \"" + _token.name + "\" has the certificate but not its key"};
    return signWithOneOf(keys, *facts, request);
}

TokenProver::~TokenProver() {
    if (_isLoggedIn) _session->module()->C_Logout(_session->handle());
}

Opening TokenProver::open(ProofRequest& request) {
    return KeyOpener(_module, _slotToken, _objects, *_session).open(*request.open, request.pin);
}

// Why the token did not let anybody in; none when it did, or when it needs no login and no PIN
// was given.
std::optional<Proof> TokenProver::login(Secret& pin) {
    if (!_token.needsLogin && pin.empty()) return {};
    if (!_token.hasPinPad && pin.empty())
        return Proof{Outcome::CardFailed,
                     {},
                     _token.pinState,
                     "the card \"" + _token.name + "\" needs a PIN and none was given"};

    CK_RV result = service::login(*_session, CKU_USER, pin, _token.hasPinPad);
    if (result == CKR_USER_ALREADY_LOGGED_IN) {
        // Somebody's login is no answer: this PIN has not been looked at yet.
        _session->module()->C_Logout(_session->handle());
        result = service::login(*_session, CKU_USER, pin, _token.hasPinPad);
    }
    if (result == CKR_OK) return {};
    Proof proof = failed(result, "let nobody in");
    if (proof.outcome == Outcome::PinIncorrect)
        proof.reason =
            "the card \"" + _token.name + "\" refused the PIN" + pinSentence(proof.pinStateAfter);
    return proof;
}

// Several keys may bear one id, and some do not tell which they are: the signature does.
Proof TokenProver::signWithOneOf(const std::vector<PrivateKey>& keys, const CertificateFacts& facts,
                                 ProofRequest& request) {
    Proof proof;
    for (const PrivateKey& key : keys) {
        Bytes signature;
        const CK_RV result = sign(key, facts, request, signature);
        if (result != CKR_OK) {
            proof = failed(result, "did not sign");
            if (proof.outcome != Outcome::CardFailed) return proof;
            continue;
        }
        if (!verifySignature(facts.publicKeyInfo, request.publicKeyHash, request.challenge,
                             signature)) {
            proof = failed(CKR_SIGNATURE_INVALID, "gave a signature that its key did not make");
            continue;
        }
        return {Outcome::Signed, std::move(signature), pinState(), {}};
    }
    return proof;
}

CK_RV TokenProver::sign(const PrivateKey& key, const CertificateFacts& facts, ProofRequest& request,
                        Bytes& signature) const {
    const Pkcs11Session& session = *_session;
    const bool hashes = facts.keyKind == KeyKind::Rsa &&
                        _module.offers(_slotToken.slot, CKM_SHA256_RSA_PKCS, CKF_SIGN);
    Bytes input = hashes ? request.challenge : signatureInput(facts, request.challenge);
    CK_MECHANISM mechanism = {};
    mechanism.mechanism = facts.keyKind == KeyKind::Ec ? CKM_ECDSA
                          : hashes                     ? CKM_SHA256_RSA_PKCS
                                                       : CKM_RSA_PKCS;
    CK_RV result = session.module()->C_SignInit(session.handle(), &mechanism, key.handle);
    if (result == CKR_OK && key.alwaysAuthenticate)
        result = service::login(session, CKU_CONTEXT_SPECIFIC, request.pin, _token.hasPinPad);
    if (result != CKR_OK) return result;

    signature.resize(kMostSignatureBytes);
    CK_ULONG size = signature.size();
    result = session.module()->C_Sign(session.handle(), input.data(), input.size(),
                                      signature.data(), &size);
    if (result != CKR_OK || size > signature.size())
        return result == CKR_OK ? CKR_DEVICE_ERROR : result;
    signature.resize(size);
    if (facts.keyKind == KeyKind::Ec) signature = ecdsaSignatureDer(signature);
    return CKR_OK;
}

Proof TokenProver::failed(CK_RV result, const std::string& what) const {
    Proof proof;
    proof.outcome = outcomeOf(result);
    proof.pinStateAfter = pinState();
    proof.reason = "the card \"" + _token.name + "\" " + what + ": " + resultText(result);
    return proof;
}

// As the token tells it now; as it was told before when the token does not answer any more.
PinState TokenProver::pinState() const {
    const SlotToken now = _module.tokenIn(_slotToken.slot);
    return now.result == CKR_OK ? pinStateOf(now.flags) : _token.pinState;
}

}  // namespace vlm::service
