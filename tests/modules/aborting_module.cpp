// Takes its process down when it is initialised.

#include <cstdlib>

#include "tests/modules/real_module.h"

static CK_RV crash(void*) { std::abort(); }

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = vlm::test::realModule();
    functions.C_Initialize = crash;
    *list = &functions;
    return CKR_OK;
}
