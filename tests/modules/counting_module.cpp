// Writes a line for each login and logout into the file that VLM_TEST_LOGIN_COUNT names. With
// VLM_TEST_RAW_RSA it offers no mechanism that hashes by itself.

#include <cstdlib>
#include <fstream>

#include "tests/modules/real_module.h"

using vlm::test::realModule;

static void note(const char* what) {
    if (const char* file = std::getenv("VLM_TEST_LOGIN_COUNT"))
        std::ofstream(file, std::ios::app) << what << "\n";
}

static CK_RV login(CK_SESSION_HANDLE session, CK_USER_TYPE user, CK_UTF8CHAR* pin, CK_ULONG size) {
    note(user == CKU_CONTEXT_SPECIFIC ? "login-again" : "login");
    return realModule().C_Login(session, user, pin, size);
}

static CK_RV logout(CK_SESSION_HANDLE session) {
    note("logout");
    return realModule().C_Logout(session);
}

static CK_RV getMechanismInfo(CK_SLOT_ID slot, CK_MECHANISM_TYPE type, CK_MECHANISM_INFO* info) {
    if (type == CKM_SHA256_RSA_PKCS && std::getenv("VLM_TEST_RAW_RSA") != nullptr)
        return CKR_MECHANISM_INVALID;
    return realModule().C_GetMechanismInfo(slot, type, info);
}

VLM_MODULE_ENTRY C_GetFunctionList(CK_FUNCTION_LIST** list) {
    static CK_FUNCTION_LIST functions = realModule();
    functions.C_Login = login;
    functions.C_Logout = logout;
    functions.C_GetMechanismInfo = getMechanismInfo;
    *list = &functions;
    return CKR_OK;
}
