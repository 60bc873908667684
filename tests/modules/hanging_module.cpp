// Never answers when it is asked about a token. It makes the file that VLM_TEST_HANGING names when
// that has begun.

#include <unistd.h>

#include <cstdlib>
#include <fstream>

#include "tests/modules/real_module.h"

static CK_RV hang(CK_SLOT_ID, CK_TOKEN_INFO*) {
    if (const char* file = std::getenv("VLM_TEST_HANGING")) std::ofstream(file) << "hanging";
    for (;;) pause();
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = vlm::test::realModule();
    functions.C_GetTokenInfo = hang;
    *list = &functions;
    return CKR_OK;
}
