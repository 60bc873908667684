#include "services/hints/tokens/token_reader.h"

#include "services/hints/tokens/card_text.h"

namespace vlm::service {
namespace {

std::optional<CertificateObject> readCertificateObject(const Pkcs11Session& session,
                                                       CK_OBJECT_HANDLE object) {
    const Attributes attributes =
        session.read(object, {CKA_CERTIFICATE_TYPE, CKA_VALUE, CKA_ID, CKA_LABEL});
    auto der = attributes.bytes(CKA_VALUE);
    if (!der || attributes.number(CKA_CERTIFICATE_TYPE) != CK_ULONG{CKC_X_509}) return {};
    auto facts = readCertificate(*der);
    if (!facts) return {};
    return CertificateObject{attributes.bytes(CKA_ID).value_or(Bytes{}),
                             cardText(attributes.text(CKA_LABEL)), std::move(*facts),
                             std::move(*der)};
}

bool readKeys(const Pkcs11Session& session, CK_OBJECT_CLASS objectClass, TokenObjects& objects) {
    const auto handles = findClass(session, objectClass);
    if (!handles) return false;
    for (const CK_OBJECT_HANDLE handle : *handles) {
        objects.showsKeys = true;
        if (auto key = readKey(session, handle, objectClass == CKO_PRIVATE_KEY))
            objects.keys.push_back(std::move(*key));
    }
    return true;
}

}  // namespace

PinState pinStateOf(CK_FLAGS tokenFlags) {
    if ((tokenFlags & CKF_USER_PIN_LOCKED) != 0) return PinState::Locked;
    if ((tokenFlags & CKF_USER_PIN_FINAL_TRY) != 0) return PinState::LastTry;
    if ((tokenFlags & CKF_USER_PIN_COUNT_LOW) != 0) return PinState::FewTriesLeft;
    return PinState::Ready;
}

Token describeToken(const SlotToken& slotToken) {
    Token token;
    token.identifier = tokenIdentifier(slotToken.fields);
    for (const std::string* text :
         {&slotToken.fields.label, &slotToken.fields.model, &slotToken.fields.manufacturer}) {
        token.name = cardText(*text);
        if (!token.name.empty()) break;
    }
    token.hasPinPad = (slotToken.flags & CKF_PROTECTED_AUTHENTICATION_PATH) != 0;
    token.needsLogin = (slotToken.flags & CKF_LOGIN_REQUIRED) != 0;
    token.pinState = pinStateOf(slotToken.flags);
    return token;
}

std::optional<KeyObject> readKey(const Pkcs11Session& session, CK_OBJECT_HANDLE object,
                                 bool isPrivate) {
    const Attributes attributes =
        session.read(object, {CKA_KEY_TYPE, CKA_ID, CKA_MODULUS, CKA_EC_POINT, CKA_SIGN, CKA_VERIFY,
                              CKA_DECRYPT, CKA_ENCRYPT, CKA_DERIVE});
    const auto type = attributes.number(CKA_KEY_TYPE);
    const bool rsa = type == CK_ULONG{CKK_RSA};
    const bool ec = type == CK_ULONG{CKK_EC};
    if (!rsa && !ec) return {};

    KeyObject key;
    key.isPrivate = isPrivate;
    key.kind = rsa ? KeyKind::Rsa : KeyKind::Ec;
    key.id = attributes.bytes(CKA_ID).value_or(Bytes{});
    key.publicPart = attributes.bytes(rsa ? CKA_MODULUS : CKA_EC_POINT).value_or(Bytes{});
    key.signs = attributes.flag(isPrivate ? CKA_SIGN : CKA_VERIFY);
    key.wraps = attributes.flag(!rsa ? CKA_DERIVE : isPrivate ? CKA_DECRYPT : CKA_ENCRYPT);
    return key;
}

WrapMechanisms wrapMechanismsIn(const Pkcs11Module& module, CK_SLOT_ID slot) {
    const auto decrypts = [&](CK_MECHANISM_TYPE mechanism) {
        return module.offers(slot, mechanism, CKF_DECRYPT);
    };
    return {.oaep = decrypts(CKM_RSA_PKCS_OAEP) || decrypts(CKM_RSA_X_509),
            .pkcs1 = decrypts(CKM_RSA_PKCS),
            .ecdh = module.offers(slot, CKM_ECDH1_DERIVE, CKF_DERIVE)};
}

std::optional<std::vector<CK_OBJECT_HANDLE>> findClass(const Pkcs11Session& session,
                                                       CK_OBJECT_CLASS objectClass) {
    return session.find({{CKA_CLASS, &objectClass, sizeof objectClass}});
}

std::optional<std::vector<CK_OBJECT_HANDLE>> findPrivateKeys(const Pkcs11Session& session,
                                                             KeyKind kind, const Bytes& id) {
    CK_OBJECT_CLASS objectClass = CKO_PRIVATE_KEY;
    CK_KEY_TYPE type = kind == KeyKind::Rsa ? CKK_RSA : CKK_EC;
    Bytes idCopy = id;
    return session.find({{CKA_CLASS, &objectClass, sizeof objectClass},
                         {CKA_KEY_TYPE, &type, sizeof type},
                         {CKA_ID, idCopy.data(), idCopy.size()}});
}

std::optional<TokenObjects> readObjects(const Pkcs11Session& session) {
    const auto certificates = findClass(session, CKO_CERTIFICATE);
    if (!certificates) return {};
    TokenObjects objects;
    for (const CK_OBJECT_HANDLE handle : *certificates)
        if (auto certificate = readCertificateObject(session, handle))
            objects.certificates.push_back(std::move(*certificate));
    // Without a certificate there is no identity, whatever keys there are.
    if (objects.certificates.empty()) return objects;
    if (!readKeys(session, CKO_PUBLIC_KEY, objects) || !readKeys(session, CKO_PRIVATE_KEY, objects))
        return {};
    return objects;
}

}  // namespace vlm::service
