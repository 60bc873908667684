#include "services/hints/tokens/anchor_reader.h"

#include <p11-kit/pkcs11.h>
#include <p11-kit/pkcs11x.h>

#include <utility>

#include "services/hints/tokens/pkcs11_module.h"
#include "services/hints/tokens/token_reader.h"

namespace vlm::service {
namespace {

void readToken(const Pkcs11Session& session, MachineAnchors& anchors) {
    const auto certificates = findClass(session, CKO_CERTIFICATE);
    for (const auto handle : certificates.value_or(std::vector<CK_OBJECT_HANDLE>{})) {
        const auto attributes =
            session.read(handle, {CKA_CERTIFICATE_TYPE, CKA_VALUE, CKA_TRUSTED, CKA_X_DISTRUSTED});
        auto der = attributes.bytes(CKA_VALUE);
        if (!der || attributes.number(CKA_CERTIFICATE_TYPE) != CK_ULONG{CKC_X_509}) continue;
        if (attributes.flag(CKA_X_DISTRUSTED))
            anchors.distrusted.push_back(std::move(*der));
        else if (attributes.flag(CKA_TRUSTED))
            anchors.trusted.push_back(std::move(*der));
    }
}

}  // namespace

std::optional<MachineAnchors> readAnchors(const std::string& modulePath) {
    std::string reason;
    const auto module = Pkcs11Module::load(modulePath, &reason);
    if (!module) return {};
    MachineAnchors anchors;
    for (const SlotToken& token : module->tokens().value_or(std::vector<SlotToken>{}))
        if (token.result == CKR_OK)
            if (const auto session = module->openSession(token.slot)) readToken(*session, anchors);
    return anchors;
}

}  // namespace vlm::service
