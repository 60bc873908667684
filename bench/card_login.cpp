// The least that a login with a card can cost: loads one card module, finds a certificate, logs in,
// lets the certificate's key sign, and verifies. No isolation, no pairing, no prompt: a yardstick.
//
//   card_login MODULE PIN CERTIFICATE-LABEL

#include <dlfcn.h>
#include <openssl/ecdsa.h>
#include <openssl/evp.h>
#include <openssl/rand.h>
#include <openssl/x509.h>
#include <p11-kit/pkcs11.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

namespace {

using Bytes = std::vector<unsigned char>;

struct Freed {
    void operator()(X509* certificate) const { X509_free(certificate); }
    void operator()(EVP_MD_CTX* context) const { EVP_MD_CTX_free(context); }
    void operator()(ECDSA_SIG* signature) const { ECDSA_SIG_free(signature); }
};

[[noreturn]] void fail(const char* what) {
    std::fprintf(stderr, "card_login: %s\n", what);
    std::exit(1);
}

void expect(CK_RV result, const char* what) {
    if (result != CKR_OK) fail(what);
}

CK_FUNCTION_LIST_PTR load(const char* path) {
    void* const library = dlopen(path, RTLD_NOW);
    if (library == nullptr) fail("the module cannot be loaded");
    const auto listOf = reinterpret_cast<CK_C_GetFunctionList>(dlsym(library, "C_GetFunctionList"));
    CK_FUNCTION_LIST_PTR functions = nullptr;
    expect(listOf(&functions), "C_GetFunctionList");
    expect(functions->C_Initialize(nullptr), "C_Initialize");
    return functions;
}

class Session {
public:
    Session(CK_FUNCTION_LIST_PTR module, CK_SLOT_ID slot) : _module(module) {
        expect(module->C_OpenSession(slot, CKF_SERIAL_SESSION, nullptr, nullptr, &_handle),
               "C_OpenSession");
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;
    ~Session() { _module->C_CloseSession(_handle); }

    // None is CK_INVALID_HANDLE.
    CK_OBJECT_HANDLE find(CK_OBJECT_CLASS kind, CK_ATTRIBUTE_TYPE by, std::string value) const {
        std::array<CK_ATTRIBUTE, 2> wanted{
            {{CKA_CLASS, &kind, sizeof kind}, {by, value.data(), value.size()}}};
        CK_OBJECT_HANDLE found = CK_INVALID_HANDLE;
        CK_ULONG count = 0;
        expect(_module->C_FindObjectsInit(_handle, wanted.data(), wanted.size()), "C_FindObjects");
        expect(_module->C_FindObjects(_handle, &found, 1, &count), "C_FindObjects");
        _module->C_FindObjectsFinal(_handle);
        return count == 1 ? found : CK_INVALID_HANDLE;
    }

    std::string read(CK_OBJECT_HANDLE object, CK_ATTRIBUTE_TYPE type) const {
        CK_ATTRIBUTE attribute{type, nullptr, 0};
        expect(_module->C_GetAttributeValue(_handle, object, &attribute, 1), "C_GetAttributeValue");
        std::string value(attribute.ulValueLen, '\0');
        attribute.pValue = value.data();
        expect(_module->C_GetAttributeValue(_handle, object, &attribute, 1), "C_GetAttributeValue");
        return value;
    }

    void login(std::string pin) const {
        auto* const text = reinterpret_cast<CK_UTF8CHAR*>(pin.data());
        expect(_module->C_Login(_handle, CKU_USER, text, pin.size()), "C_Login");
    }

    Bytes sign(CK_OBJECT_HANDLE key, CK_MECHANISM_TYPE type, Bytes data) const {
        CK_MECHANISM mechanism{type, nullptr, 0};
        Bytes signature(1024);
        CK_ULONG size = signature.size();
        expect(_module->C_SignInit(_handle, &mechanism, key), "C_SignInit");
        expect(_module->C_Sign(_handle, data.data(), data.size(), signature.data(), &size),
               "C_Sign");
        signature.resize(size);
        return signature;
    }

private:
    CK_FUNCTION_LIST_PTR _module;
    CK_SESSION_HANDLE _handle = CK_INVALID_HANDLE;
};

bool verifies(EVP_PKEY* key, const Bytes& data, Bytes signature) {
    if (EVP_PKEY_get_base_id(key) == EVP_PKEY_EC) {
        const auto half = static_cast<int>(signature.size() / 2);
        const std::unique_ptr<ECDSA_SIG, Freed> pair(ECDSA_SIG_new());
        ECDSA_SIG_set0(pair.get(), BN_bin2bn(signature.data(), half, nullptr),
                       BN_bin2bn(signature.data() + half, half, nullptr));
        Bytes der(static_cast<std::size_t>(i2d_ECDSA_SIG(pair.get(), nullptr)));
        unsigned char* end = der.data();
        i2d_ECDSA_SIG(pair.get(), &end);
        signature = der;
    }
    const std::unique_ptr<EVP_MD_CTX, Freed> context(EVP_MD_CTX_new());
    return EVP_DigestVerifyInit(context.get(), nullptr, EVP_sha256(), nullptr, key) == 1 &&
           EVP_DigestVerify(context.get(), signature.data(), signature.size(), data.data(),
                            data.size()) == 1;
}

Bytes digest(const Bytes& data) {
    Bytes result(EVP_MAX_MD_SIZE);
    unsigned size = 0;
    EVP_Digest(data.data(), data.size(), result.data(), &size, EVP_sha256(), nullptr);
    result.resize(size);
    return result;
}

// Whether this card holds the certificate; ends the program when its key does not sign.
bool logIn(CK_FUNCTION_LIST_PTR module, CK_SLOT_ID slot, const std::string& pin,
           const std::string& label) {
    const Session session(module, slot);
    const auto object = session.find(CKO_CERTIFICATE, CKA_LABEL, label);
    if (object == CK_INVALID_HANDLE) return false;
    const auto der = session.read(object, CKA_VALUE);
    const auto* begin = reinterpret_cast<const unsigned char*>(der.data());
    const std::unique_ptr<X509, Freed> certificate(
        d2i_X509(nullptr, &begin, static_cast<long>(der.size())));
    if (!certificate) fail("there is no certificate in the certificate");
    EVP_PKEY* const publicKey = X509_get0_pubkey(certificate.get());

    session.login(pin);
    const auto key = session.find(CKO_PRIVATE_KEY, CKA_ID, session.read(object, CKA_ID));
    Bytes challenge(32);
    RAND_bytes(challenge.data(), static_cast<int>(challenge.size()));
    const bool isRsa = EVP_PKEY_get_base_id(publicKey) == EVP_PKEY_RSA;
    const auto signature = isRsa ? session.sign(key, CKM_SHA256_RSA_PKCS, challenge)
                                 : session.sign(key, CKM_ECDSA, digest(challenge));
    if (!verifies(publicKey, challenge, signature)) fail("the signature is by another key");
    return true;
}

}  // namespace

int main(int argc, char* argv[]) {
    if (argc != 4) fail("usage: card_login MODULE PIN CERTIFICATE-LABEL");
    const auto module = load(argv[1]);
    CK_ULONG count = 0;
    expect(module->C_GetSlotList(CK_TRUE, nullptr, &count), "C_GetSlotList");
    std::vector<CK_SLOT_ID> slots(count);
    expect(module->C_GetSlotList(CK_TRUE, slots.data(), &count), "C_GetSlotList");
    for (const CK_SLOT_ID slot : slots) {
        CK_TOKEN_INFO token{};
        if (module->C_GetTokenInfo(slot, &token) != CKR_OK ||
            (token.flags & CKF_TOKEN_INITIALIZED) == 0)
            continue;
        if (logIn(module, slot, argv[2], argv[3])) {
            module->C_Finalize(nullptr);
            return 0;
        }
    }
    fail("no card holds this certificate");
}
