// Tells of more slots, objects and bytes than there are.

#include <algorithm>
#include <span>

#include "tests/modules/real_module.h"

using vlm::test::realModule;

static constexpr CK_ULONG kAbsurd = CK_ULONG{1} << 40U;

static CK_RV getSlotList(CK_BBOOL withToken, CK_SLOT_ID* slots, CK_ULONG* count) {
    const CK_RV result = realModule().C_GetSlotList(withToken, slots, count);
    if (slots == nullptr) *count = kAbsurd;
    return result;
}

static CK_RV findObjects(CK_SESSION_HANDLE session, CK_OBJECT_HANDLE* objects, CK_ULONG most,
                         CK_ULONG* count) {
    const CK_RV result = realModule().C_FindObjects(session, objects, most, count);
    if (*count > 0) *count = kAbsurd;
    return result;
}

static CK_RV getAttributeValue(CK_SESSION_HANDLE session, CK_OBJECT_HANDLE object,
                               CK_ATTRIBUTE* attributes, CK_ULONG count) {
    const CK_RV result = realModule().C_GetAttributeValue(session, object, attributes, count);
    for (CK_ATTRIBUTE& attribute : std::span(attributes, count))
        if (attribute.type == CKA_LABEL) attribute.ulValueLen = kAbsurd;
    return result;
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = realModule();
    functions.C_GetSlotList = getSlotList;
    functions.C_FindObjects = findObjects;
    functions.C_GetAttributeValue = getAttributeValue;
    *list = &functions;
    return CKR_OK;
}
