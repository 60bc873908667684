// Never answers when it is asked about a token.

#include <unistd.h>

#include "tests/modules/real_module.h"

static CK_RV hang(CK_SLOT_ID, CK_TOKEN_INFO*) {
    for (;;) pause();
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = vlm::tests::realModule();
    functions.C_GetTokenInfo = hang;
    *list = &functions;
    return CKR_OK;
}
