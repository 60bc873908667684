#include "services/hints/tokens/key_opener.h"

#include <algorithm>
#include <array>
#include <utility>

#include "platform/text.h"
#include "services/hints/tokens/ephemeral_point.h"
#include "services/hints/tokens/oaep_padding.h"
#include "services/hints/tokens/token_reader.h"

namespace vlm::service {
namespace {

// The bare operation's result with zeros in front, which some modules leave out.
Secret inFullSize(const Secret& number, std::size_t size) {
    Secret full = Secret::ofSize(size);
    const auto digits = number.octets();
    const std::size_t used = std::min(digits.size(), size);
    std::ranges::copy(digits.last(used), full.octets().last(used).begin());
    return full;
}

CK_MECHANISM mechanismOf(CK_MECHANISM_TYPE type) {
    CK_MECHANISM mechanism = {};
    mechanism.mechanism = type;
    return mechanism;
}

// Why the key cannot have to do with what is to be opened; empty when it can. What comes from a
// disk is not given to a card unseen.
std::string mismatch(const CertificateFacts& key, const OpenRequest& request) {
    const bool wantsEc = request.scheme == WrapScheme::Ecdh;
    if (wantsEc != (key.keyKind == KeyKind::Ec)) return "the key is of another kind";
    if (wantsEc && !isPointForKey(request.sealed, key.publicKeyInfo))
        return "what it was to open is no point of the key's curve";
    if (!wantsEc && request.sealed.size() != key.publicNumber.size())
        return "what it was to open is not of the key's size";
    return {};
}

}  // namespace

KeyOpener::KeyOpener(const Pkcs11Module& module, const SlotToken& slotToken,
                     const TokenObjects& objects, const Pkcs11Session& session)
    : _module(module),
      _session(session),
      _objects(objects),
      _slot(slotToken.slot),
      _cardName(describeToken(slotToken).name),
      _hasPinPad(describeToken(slotToken).hasPinPad) {}

Opening KeyOpener::open(const OpenRequest& request, Secret& pin) const {
    const auto failed = [this](const std::string& why) {
        return Opening{{}, platform::text("the card \"{}\" opened nothing: {}", _cardName, why)};
    };
    const CertificateFacts* facts = factsOf(_objects, request.wrapKeyHash);
    if (facts == nullptr) return failed("it has no such identity");
    if (const auto why = mismatch(*facts, request); !why.empty()) return failed(why);
    const auto keys = privateKeysOf(_session, _objects, request.wrapKeyHash);
    CK_RV result = CKR_KEY_HANDLE_INVALID;
    for (const PrivateKey& key : keys) {
        Opening made;
        result = openWith(key, request, pin, made.opened);
        if (result == CKR_OK && !made.opened.empty()) return made;
    }
    return failed(keys.empty() ? "it has the certificate but not its key" : resultText(result));
}

CK_RV KeyOpener::openWith(const PrivateKey& key, const OpenRequest& request, Secret& pin,
                          Secret& opened) const {
    switch (request.scheme) {
        case WrapScheme::RsaOaepSha256:
            return decryptOaep(key, request.sealed, pin, opened);
        case WrapScheme::RsaPkcs1:
            return decrypt(mechanismOf(CKM_RSA_PKCS), key, request.sealed, pin, opened);
        case WrapScheme::Ecdh:
            return derive(key, request.sealed, pin, opened);
    }
    return CKR_MECHANISM_INVALID;
}

// Some modules offer OAEP with SHA-1 only, and say so when they are given something else. They do
// the bare operation, if not this one.
CK_RV KeyOpener::decryptOaep(const PrivateKey& key, const Bytes& sealed, Secret& pin,
                             Secret& opened) const {
    CK_RSA_PKCS_OAEP_PARAMS parameters = {};
    parameters.hash_alg = CKM_SHA256;
    parameters.mgf = CKG_MGF1_SHA256;
    parameters.source = CKZ_DATA_SPECIFIED;
    CK_MECHANISM oaep = mechanismOf(CKM_RSA_PKCS_OAEP);
    oaep.pParameter = &parameters;
    oaep.ulParameterLen = sizeof parameters;
    CK_RV result = CKR_MECHANISM_INVALID;
    if (_module.offers(_slot, CKM_RSA_PKCS_OAEP, CKF_DECRYPT))
        result = decrypt(oaep, key, sealed, pin, opened);
    if (result == CKR_OK || !_module.offers(_slot, CKM_RSA_X_509, CKF_DECRYPT)) return result;

    Secret block;
    result = decrypt(mechanismOf(CKM_RSA_X_509), key, sealed, pin, block);
    if (result != CKR_OK) return result;
    auto content = withoutOaepPadding(inFullSize(block, sealed.size()), sealed.size());
    if (!content) return CKR_ENCRYPTED_DATA_INVALID;
    opened = std::move(*content);
    return CKR_OK;
}

CK_RV KeyOpener::decrypt(CK_MECHANISM mechanism, const PrivateKey& key, Bytes sealed, Secret& pin,
                         Secret& opened) const {
    CK_FUNCTION_LIST* module = _session.module();
    CK_RV result = module->C_DecryptInit(_session.handle(), &mechanism, key.handle);
    if (result == CKR_OK && key.alwaysAuthenticate)
        result = login(_session, CKU_CONTEXT_SPECIFIC, pin, _hasPinPad);
    if (result != CKR_OK) return result;

    auto decrypted = Secret::ofSize(sealed.size());
    CK_ULONG size = sealed.size();
    result = module->C_Decrypt(_session.handle(), sealed.data(), sealed.size(),
                               decrypted.octets().data(), &size);
    if (result != CKR_OK) return result;
    if (size > sealed.size()) return CKR_DEVICE_ERROR;
    decrypted.shorten(size);
    opened = std::move(decrypted);
    return CKR_OK;
}

// The common point is an object of the session for as long as it takes to read it.
CK_RV KeyOpener::derive(const PrivateKey& key, Bytes point, Secret& pin, Secret& opened) const {
    CK_FUNCTION_LIST* module = _session.module();
    CK_ECDH1_DERIVE_PARAMS parameters = {};
    parameters.kdf = CKD_NULL;
    parameters.public_data = point.data();
    parameters.public_data_len = point.size();
    CK_MECHANISM ecdh = mechanismOf(CKM_ECDH1_DERIVE);
    ecdh.pParameter = &parameters;
    ecdh.ulParameterLen = sizeof parameters;

    CK_OBJECT_CLASS objectClass = CKO_SECRET_KEY;
    CK_KEY_TYPE type = CKK_GENERIC_SECRET;
    CK_BBOOL yes = CK_TRUE;
    CK_BBOOL no = CK_FALSE;
    CK_ULONG size = point.size() / 2;  // of one coordinate
    std::array<CK_ATTRIBUTE, 6> attributes = {{{CKA_CLASS, &objectClass, sizeof objectClass},
                                               {CKA_KEY_TYPE, &type, sizeof type},
                                               {CKA_TOKEN, &no, sizeof no},
                                               {CKA_SENSITIVE, &no, sizeof no},
                                               {CKA_EXTRACTABLE, &yes, sizeof yes},
                                               {CKA_VALUE_LEN, &size, sizeof size}}};
    // There is no beginning of this operation to log in for again; a module that wants it all the
    // same takes it before.
    if (key.alwaysAuthenticate) login(_session, CKU_CONTEXT_SPECIFIC, pin, _hasPinPad);
    CK_OBJECT_HANDLE derived = 0;
    CK_RV result = module->C_DeriveKey(_session.handle(), &ecdh, key.handle, attributes.data(),
                                       attributes.size(), &derived);
    if (result != CKR_OK) return result;
    auto value = Secret::ofSize(size);
    CK_ATTRIBUTE read = {CKA_VALUE, value.octets().data(), size};
    result = module->C_GetAttributeValue(_session.handle(), derived, &read, 1);
    module->C_DestroyObject(_session.handle(), derived);
    if (result != CKR_OK) return result;
    if (read.ulValueLen > size) return CKR_DEVICE_ERROR;
    value.shorten(read.ulValueLen);
    opened = inFullSize(value, size);
    return CKR_OK;
}

}  // namespace vlm::service
