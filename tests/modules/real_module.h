// For card modules that misbehave in one point: they hand everything else on to the software
// module.

#pragma once

#include <dlfcn.h>
#include <p11-kit/pkcs11.h>

namespace vlm::test {

inline const CK_FUNCTION_LIST& realModule() {
    static const CK_FUNCTION_LIST* const kModule = [] {
        void* library = dlopen(VLM_SOFTHSM_MODULE, RTLD_NOW | RTLD_LOCAL);
        const auto entry = reinterpret_cast<CK_C_GetFunctionList>(
            library == nullptr ? nullptr : dlsym(library, "C_GetFunctionList"));
        CK_FUNCTION_LIST* functions = nullptr;
        if (entry != nullptr) entry(&functions);
        return functions;
    }();
    return *kModule;
}

}  // namespace vlm::test

#define VLM_MODULE_ENTRY extern "C" __attribute__((visibility("default"))) CK_RV
