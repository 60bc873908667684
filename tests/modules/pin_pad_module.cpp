// Behaves like a reader with a PIN pad: it takes no PIN from the program. The person at the pad is
// the file that VLM_TEST_PIN_PAD names: what is in it is typed; "cancel" presses the red key, and
// an empty file is somebody who went away.

#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <string>

#include "tests/modules/real_module.h"

using vlm::test::realModule;

static CK_RV getTokenInfo(CK_SLOT_ID slot, CK_TOKEN_INFO* info) {
    const CK_RV result = realModule().C_GetTokenInfo(slot, info);
    info->flags |= CKF_PROTECTED_AUTHENTICATION_PATH;
    return result;
}

static CK_RV login(CK_SESSION_HANDLE session, CK_USER_TYPE user, CK_UTF8CHAR* pin, CK_ULONG) {
    if (pin != nullptr) return CKR_ARGUMENTS_BAD;
    const char* file = std::getenv("VLM_TEST_PIN_PAD");
    std::string typed;
    if (file != nullptr) std::ifstream(file) >> typed;
    if (typed == "cancel") return CKR_FUNCTION_CANCELED;
    while (typed.empty()) pause();
    return realModule().C_Login(session, user, reinterpret_cast<CK_UTF8CHAR*>(typed.data()),
                                typed.size());
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = realModule();
    functions.C_GetTokenInfo = getTokenInfo;
    functions.C_Login = login;
    *list = &functions;
    return CKR_OK;
}
