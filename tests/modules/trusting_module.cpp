// Calls every certificate that it holds trusted, or distrusted where its label is "distrusted".

#include <p11-kit/pkcs11.h>
#include <p11-kit/pkcs11x.h>

#include <cstring>
#include <span>

#include "tests/modules/real_module.h"

using vlm::test::realModule;

static bool isDistrusted(CK_SESSION_HANDLE session, CK_OBJECT_HANDLE object) {
    char label[16] = {};
    CK_ATTRIBUTE attribute = {CKA_LABEL, label, sizeof label - 1};
    return realModule().C_GetAttributeValue(session, object, &attribute, 1) == CKR_OK &&
           std::strcmp(label, "distrusted") == 0;
}

static void answer(CK_ATTRIBUTE& attribute, bool value) {
    if (attribute.pValue != nullptr)
        *static_cast<CK_BBOOL*>(attribute.pValue) = value ? CK_TRUE : CK_FALSE;
    attribute.ulValueLen = sizeof(CK_BBOOL);
}

static CK_RV getAttributeValue(CK_SESSION_HANDLE session, CK_OBJECT_HANDLE object,
                               CK_ATTRIBUTE* attributes, CK_ULONG count) {
    CK_RV result = CKR_OK;
    const bool distrusted = isDistrusted(session, object);
    for (CK_ATTRIBUTE& attribute : std::span(attributes, count)) {
        if (attribute.type == CKA_TRUSTED)
            answer(attribute, !distrusted);
        else if (attribute.type == CKA_X_DISTRUSTED)
            answer(attribute, distrusted);
        else if (const CK_RV one = realModule().C_GetAttributeValue(session, object, &attribute, 1);
                 one != CKR_OK)
            result = one;
    }
    return result;
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = realModule();
    functions.C_GetAttributeValue = getAttributeValue;
    *list = &functions;
    return CKR_OK;
}
