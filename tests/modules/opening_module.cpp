// Opens what was wrapped in a way of its own; VLM_TEST_OPENING says which:
//
//   pkcs1-only   RSA with the old padding, and nothing else
//   oaep-only    OAEP with SHA-256, as the software module by itself does not
//   all          this, and what the software module does
//   nothing      neither RSA nor ECDH
//   short        leaves the zero in front of an RSA block out
//   refuses      offers everything and does nothing of it
//   long         tells of more bytes than there is room for
//   lies         opens something else
//   crashes, hangs

#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string_view>

#include "services/hints/tokens/oaep_padding.h"
#include "tests/modules/real_module.h"

using vlm::test::realModule;

static bool isA(std::string_view trait) {
    const char* given = std::getenv("VLM_TEST_OPENING");
    return given != nullptr && given == trait;
}

static void fail() {
    if (isA("crashes")) std::abort();
    while (isA("hangs")) pause();
}

static bool hides(CK_MECHANISM_TYPE type) {
    if (type == CKM_ECDH1_DERIVE) return isA("nothing");
    if (type == CKM_RSA_PKCS) return isA("nothing") || isA("oaep-only");
    if (type == CKM_RSA_X_509) return isA("nothing") || isA("oaep-only") || isA("pkcs1-only");
    return type == CKM_RSA_PKCS_OAEP && (isA("nothing") || isA("pkcs1-only"));
}

static CK_RV getMechanismInfo(CK_SLOT_ID slot, CK_MECHANISM_TYPE type, CK_MECHANISM_INFO* info) {
    return hides(type) ? CKR_MECHANISM_INVALID : realModule().C_GetMechanismInfo(slot, type, info);
}

static bool takesPaddingOff = false;

static CK_RV decryptInit(CK_SESSION_HANDLE session, CK_MECHANISM* mechanism, CK_OBJECT_HANDLE key) {
    fail();
    if (isA("refuses") || hides(mechanism->mechanism)) return CKR_FUNCTION_FAILED;
    takesPaddingOff = (isA("oaep-only") || isA("all")) && mechanism->mechanism == CKM_RSA_PKCS_OAEP;
    if (!takesPaddingOff) return realModule().C_DecryptInit(session, mechanism, key);
    const auto* parameters = static_cast<CK_RSA_PKCS_OAEP_PARAMS*>(mechanism->pParameter);
    if (parameters->hash_alg != CKM_SHA256 || parameters->mgf != CKG_MGF1_SHA256 ||
        parameters->source_data_len != 0)
        return CKR_MECHANISM_PARAM_INVALID;
    CK_MECHANISM bare = {};
    bare.mechanism = CKM_RSA_X_509;
    return realModule().C_DecryptInit(session, &bare, key);
}

static CK_RV decrypt(CK_SESSION_HANDLE session, CK_BYTE* data, CK_ULONG dataSize, CK_BYTE* result,
                     CK_ULONG* size) {
    const CK_RV status = realModule().C_Decrypt(session, data, dataSize, result, size);
    if (status != CKR_OK) return status;
    if (takesPaddingOff) {
        auto block = vlm::service::Secret::ofSize(*size);
        std::copy_n(result, *size, block.octets().data());
        const auto content = vlm::service::withoutOaepPadding(block, *size);
        if (!content) return CKR_ENCRYPTED_DATA_INVALID;
        std::ranges::copy(content->octets(), result);
        *size = content->octets().size();
    }
    if (isA("short")) std::copy_n(result + 1, --*size, result);
    if (isA("long")) *size = CK_ULONG{1} << 40U;
    if (isA("lies")) result[*size - 1] ^= 1U;
    return CKR_OK;
}

static CK_RV deriveKey(CK_SESSION_HANDLE session, CK_MECHANISM* mechanism, CK_OBJECT_HANDLE key,
                       CK_ATTRIBUTE* attributes, CK_ULONG count, CK_OBJECT_HANDLE* derived) {
    fail();
    if (isA("refuses")) return CKR_FUNCTION_FAILED;
    return realModule().C_DeriveKey(session, mechanism, key, attributes, count, derived);
}

// A certificate's value is read among other attributes, a derived key's is alone.
static CK_RV getAttributeValue(CK_SESSION_HANDLE session, CK_OBJECT_HANDLE object,
                               CK_ATTRIBUTE* attributes, CK_ULONG count) {
    const CK_RV status = realModule().C_GetAttributeValue(session, object, attributes, count);
    if (status != CKR_OK || count != 1 || attributes->type != CKA_VALUE) return status;
    if (isA("long")) attributes->ulValueLen = CK_ULONG{1} << 40U;
    if (isA("lies")) static_cast<CK_BYTE*>(attributes->pValue)[0] ^= 1U;
    return CKR_OK;
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = realModule();
    functions.C_GetMechanismInfo = getMechanismInfo;
    functions.C_DecryptInit = decryptInit;
    functions.C_Decrypt = decrypt;
    functions.C_DeriveKey = deriveKey;
    functions.C_GetAttributeValue = getAttributeValue;
    *list = &functions;
    return CKR_OK;
}
