// Finds object after object on a token, without an end.

#include <algorithm>

#include "tests/modules/real_module.h"

static CK_RV findObjects(CK_SESSION_HANDLE, CK_OBJECT_HANDLE* objects, CK_ULONG most,
                         CK_ULONG* count) {
    std::fill_n(objects, most, CK_OBJECT_HANDLE{1});
    *count = most;
    return CKR_OK;
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = vlm::test::realModule();
    functions.C_FindObjects = findObjects;
    *list = &functions;
    return CKR_OK;
}
