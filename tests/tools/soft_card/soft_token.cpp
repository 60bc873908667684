#include "tests/tools/soft_card/soft_token.h"

#include <openssl/core_names.h>
#include <p11-kit/p11-kit.h>

#include <iomanip>
#include <sstream>
#include <stdexcept>
#include <vector>

#include "tests/tools/soft_card/test_key.h"

namespace vlm::test {
namespace {

class Failure : public std::runtime_error {
    using std::runtime_error::runtime_error;
};

void check(CK_RV result, const char* what) {
    if (result == CKR_OK) return;
    std::ostringstream text;
    text << what << ": error " << std::hex << std::showbase << result;
    throw Failure(text.str());
}

// An object to be made: attributes with the values that they point to.
class Template {
public:
    void add(CK_ATTRIBUTE_TYPE type, Octets value) { _values.push_back({type, std::move(value)}); }
    void add(CK_ATTRIBUTE_TYPE type, bool flag) { add(type, Octets(1, flag ? '\1' : '\0')); }
    void addNumber(CK_ATTRIBUTE_TYPE type, CK_ULONG number) {
        add(type, Octets(reinterpret_cast<const char*>(&number), sizeof number));
    }

    void create(CK_FUNCTION_LIST* module, CK_SESSION_HANDLE session, const char* what) {
        std::vector<CK_ATTRIBUTE> attributes;
        for (auto& [type, value] : _values)
            attributes.push_back({type, value.data(), value.size()});
        CK_OBJECT_HANDLE object = 0;
        check(module->C_CreateObject(session, attributes.data(), attributes.size(), &object), what);
    }

private:
    std::vector<std::pair<CK_ATTRIBUTE_TYPE, Octets>> _values;
};

Octets fromHex(const std::string& hex) {
    Octets octets;
    for (std::size_t i = 0; i + 1 < hex.size(); i += 2)
        octets += static_cast<char>(std::stoi(hex.substr(i, 2), nullptr, 16));
    return octets;
}

CK_UTF8CHAR* pinText(std::string& pin) { return reinterpret_cast<CK_UTF8CHAR*>(pin.data()); }

// What every object of an identity has.
Template objectOf(CK_OBJECT_CLASS kind, const CardIdentity& identity, bool isPrivate) {
    Template object;
    object.addNumber(CKA_CLASS, kind);
    object.add(CKA_TOKEN, true);
    object.add(CKA_PRIVATE, isPrivate);
    object.add(CKA_LABEL, identity.label);
    object.add(CKA_ID, fromHex(identity.id));
    return object;
}

Template certificateOf(const Key& key, const CardIdentity& identity,
                       const CardCertificate& certificate) {
    const auto parts = certify(key, certificate);
    if (!parts) throw Failure("the certificate of " + certificate.commonName + " cannot be made");
    Template object = objectOf(CKO_CERTIFICATE, identity, false);
    object.addNumber(CKA_CERTIFICATE_TYPE, CKC_X_509);
    object.add(CKA_SUBJECT, parts->subject);
    object.add(CKA_ISSUER, parts->issuer);
    object.add(CKA_SERIAL_NUMBER, parts->serial);
    object.add(CKA_VALUE, parts->der);
    return object;
}

Template privateKeyOf(const Key& key, const CardIdentity& identity) {
    Template object = objectOf(CKO_PRIVATE_KEY, identity, true);
    object.addNumber(CKA_KEY_TYPE, isRsa(key) ? CKK_RSA : CKK_EC);
    object.add(CKA_SENSITIVE, true);
    object.add(CKA_EXTRACTABLE, false);
    object.add(CKA_SIGN, identity.sign);
    object.add(CKA_ALWAYS_AUTHENTICATE, identity.alwaysAuthenticate);
    if (isRsa(key)) {
        object.add(CKA_DECRYPT, identity.decrypt);
        object.add(CKA_UNWRAP, identity.decrypt);
        object.add(CKA_MODULUS, keyNumber(key, OSSL_PKEY_PARAM_RSA_N));
        object.add(CKA_PUBLIC_EXPONENT, keyNumber(key, OSSL_PKEY_PARAM_RSA_E));
        object.add(CKA_PRIVATE_EXPONENT, keyNumber(key, OSSL_PKEY_PARAM_RSA_D));
        object.add(CKA_PRIME_1, keyNumber(key, OSSL_PKEY_PARAM_RSA_FACTOR1));
        object.add(CKA_PRIME_2, keyNumber(key, OSSL_PKEY_PARAM_RSA_FACTOR2));
        object.add(CKA_EXPONENT_1, keyNumber(key, OSSL_PKEY_PARAM_RSA_EXPONENT1));
        object.add(CKA_EXPONENT_2, keyNumber(key, OSSL_PKEY_PARAM_RSA_EXPONENT2));
        object.add(CKA_COEFFICIENT, keyNumber(key, OSSL_PKEY_PARAM_RSA_COEFFICIENT1));
    } else {
        object.add(CKA_DERIVE, identity.derive);
        object.add(CKA_EC_PARAMS, curveOf(key));
        object.add(CKA_VALUE, keyNumber(key, OSSL_PKEY_PARAM_PRIV_KEY));
    }
    return object;
}

Template publicKeyOf(const Key& key, const CardIdentity& identity) {
    Template object = objectOf(CKO_PUBLIC_KEY, identity, identity.publicKeyHidden);
    object.addNumber(CKA_KEY_TYPE, isRsa(key) ? CKK_RSA : CKK_EC);
    object.add(CKA_VERIFY, identity.sign);
    if (isRsa(key)) {
        object.add(CKA_ENCRYPT, identity.decrypt);
        object.add(CKA_WRAP, identity.decrypt);
        object.add(CKA_MODULUS, keyNumber(key, OSSL_PKEY_PARAM_RSA_N));
        object.add(CKA_PUBLIC_EXPONENT, keyNumber(key, OSSL_PKEY_PARAM_RSA_E));
    } else {
        object.add(CKA_DERIVE, identity.derive);
        object.add(CKA_EC_PARAMS, curveOf(key));
        object.add(CKA_EC_POINT, pointOf(key));
    }
    return object;
}

CK_SLOT_ID freeSlot(CK_FUNCTION_LIST* module) {
    CK_ULONG count = 0;
    check(module->C_GetSlotList(CK_TRUE, nullptr, &count), "counting the slots");
    std::vector<CK_SLOT_ID> slots(count);
    check(module->C_GetSlotList(CK_TRUE, slots.data(), &count), "listing the slots");
    for (const CK_SLOT_ID slot : slots) {
        CK_TOKEN_INFO info;
        if (module->C_GetTokenInfo(slot, &info) == CKR_OK &&
            (info.flags & CKF_TOKEN_INITIALIZED) == 0)
            return slot;
    }
    throw Failure("the module offers no slot for a new token");
}

// A session on a new token, logged in as its user.
CK_SESSION_HANDLE openNewToken(CK_FUNCTION_LIST* module, const Card& card) {
    const CK_SLOT_ID slot = freeSlot(module);
    std::string label = card.label;
    label.resize(32, ' ');
    std::string pin = card.pin;
    std::string adminPin = "12345678";
    CK_SESSION_HANDLE session = 0;
    check(module->C_InitToken(slot, pinText(adminPin), adminPin.size(), pinText(label)),
          "initialising the token");
    check(module->C_OpenSession(slot, CKF_SERIAL_SESSION | CKF_RW_SESSION, nullptr, nullptr,
                                &session),
          "opening a session");
    check(module->C_Login(session, CKU_SO, pinText(adminPin), adminPin.size()), "logging in");
    check(module->C_InitPIN(session, pinText(pin), pin.size()), "setting the PIN");
    check(module->C_Logout(session), "logging out");
    check(module->C_Login(session, CKU_USER, pinText(pin), pin.size()), "logging in with the PIN");
    return session;
}

void writeIdentity(CK_FUNCTION_LIST* module, CK_SESSION_HANDLE session,
                   const CardIdentity& identity) {
    const Key key = makeKey(identity.key);
    if (!key) throw Failure("no such kind of key: " + identity.key);
    if (identity.privateKey)
        privateKeyOf(key, identity).create(module, session, "writing a private key");
    if (identity.publicKey)
        publicKeyOf(key, identity).create(module, session, "writing a public key");
    for (const CardCertificate& certificate : identity.certificates)
        certificateOf(key, identity, certificate).create(module, session, "writing a certificate");
}

}  // namespace

SoftTokenStore::SoftTokenStore(const std::string& modulePath)
    : _module(p11_kit_module_load(modulePath.c_str(), P11_KIT_MODULE_UNMANAGED)) {
    if (_module != nullptr && p11_kit_module_initialize(_module) != CKR_OK) {
        p11_kit_module_release(_module);
        _module = nullptr;
    }
}

SoftTokenStore::~SoftTokenStore() {
    if (_module == nullptr) return;
    p11_kit_module_finalize(_module);
    p11_kit_module_release(_module);
}

std::optional<std::string> SoftTokenStore::write(const Card& card) {
    if (_module == nullptr) return "the module cannot be loaded";
    try {
        const CK_SESSION_HANDLE session = openNewToken(_module, card);
        int number = 0;
        for (CardIdentity identity : card.identities) {
            ++number;
            if (identity.id.empty()) {
                std::ostringstream id;
                id << std::hex << std::setfill('0') << std::setw(4) << number;
                identity.id = id.str();
            }
            writeIdentity(_module, session, identity);
        }
        check(_module->C_CloseSession(session), "closing the session");
        return {};
    } catch (const std::exception& failure) {
        return "writing the card \"" + card.label + "\": " + failure.what();
    }
}

}  // namespace vlm::test
