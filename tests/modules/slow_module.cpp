// Answers nobody who asks about a token before the file that VLM_TEST_SLOW names is there.

#include <unistd.h>

#include <cstdlib>

#include "tests/modules/real_module.h"

static CK_RV waitFirst(CK_SLOT_ID slot, CK_TOKEN_INFO* info) {
    constexpr useconds_t kLookAgainAfter = 10'000;
    const char* file = std::getenv("VLM_TEST_SLOW");
    while (file != nullptr && access(file, F_OK) != 0) usleep(kLookAgainAfter);
    return vlm::test::realModule().C_GetTokenInfo(slot, info);
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = vlm::test::realModule();
    functions.C_GetTokenInfo = waitFirst;
    *list = &functions;
    return CKR_OK;
}
