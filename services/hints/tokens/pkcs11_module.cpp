#include "services/hints/tokens/pkcs11_module.h"

#include <p11-kit/p11-kit.h>

#include <algorithm>
#include <sstream>
#include <utility>

#include "platform/text.h"
#include "services/hints/tokens/card_text.h"

namespace vlm::service {
namespace {

template <std::size_t size>
std::string field(const CK_UTF8CHAR (&padded)[size]) {
    return {reinterpret_cast<const char*>(padded), size};
}

// One thread calls, and says so: without locks a module cannot lock itself out, as one does when
// its card is pulled while it is read.
CK_RV initialize(CK_FUNCTION_LIST* module) { return module->C_Initialize(nullptr); }

}  // namespace

std::string resultText(CK_RV result) {
    std::ostringstream number;
    number << std::hex << std::showbase << result;
    return platform::text("{} ({})", cardText(p11_kit_strerror(result)), number.str());
}

std::unique_ptr<Pkcs11Module> Pkcs11Module::load(const std::string& path, std::string* reason) {
    CK_FUNCTION_LIST* module =
        p11_kit_module_load(path.c_str(), P11_KIT_MODULE_CRITICAL | P11_KIT_MODULE_UNMANAGED);
    if (module == nullptr) {
        const char* message = p11_kit_message();
        *reason = "it cannot be loaded: " + cardText(message == nullptr ? path : message);
        return nullptr;
    }
    const CK_RV result = initialize(module);
    if (result != CKR_OK) {
        p11_kit_module_release(module);
        *reason = "it cannot be initialised: " + resultText(result);
        return nullptr;
    }
    return std::unique_ptr<Pkcs11Module>(new Pkcs11Module(module));
}

Pkcs11Module::~Pkcs11Module() {
    _module->C_Finalize(nullptr);
    p11_kit_module_release(_module);
}

void Pkcs11Module::reinitialize() {
    _module->C_Finalize(nullptr);
    initialize(_module);
}

std::optional<std::vector<CK_SLOT_ID>> Pkcs11Module::slots(bool withToken) const {
    // Asking for the number first makes a module look again at what is there.
    CK_ULONG count = 0;
    if (_module->C_GetSlotList(withToken, nullptr, &count) != CKR_OK) return {};
    // Some room more, for a card that comes in between.
    std::vector<CK_SLOT_ID> slots(std::min<std::size_t>(count, kMostSlots) + 8);
    count = slots.size();
    if (_module->C_GetSlotList(withToken, slots.data(), &count) != CKR_OK) return {};
    slots.resize(std::min<std::size_t>(count, slots.size()));
    return slots;
}

std::optional<std::vector<SlotToken>> Pkcs11Module::tokens() const {
    const auto withToken = slots(true);
    if (!withToken) return {};
    std::vector<SlotToken> tokens;
    for (const CK_SLOT_ID slot : *withToken) tokens.push_back(tokenIn(slot));
    return tokens;
}

SlotToken Pkcs11Module::tokenIn(CK_SLOT_ID slot) const {
    SlotToken token;
    CK_TOKEN_INFO info = {};
    token.slot = slot;
    token.result = _module->C_GetTokenInfo(slot, &info);
    if (token.result != CKR_OK) return token;
    token.flags = info.flags;
    token.fields = {field(info.model), field(info.manufacturerID), field(info.serialNumber),
                    field(info.label)};
    return token;
}

bool Pkcs11Module::isSoftware() const {
    const auto all = slots(false);
    return !all || std::ranges::none_of(*all, [this](CK_SLOT_ID slot) {
        CK_SLOT_INFO info = {};
        return _module->C_GetSlotInfo(slot, &info) == CKR_OK && (info.flags & CKF_HW_SLOT) != 0;
    });
}

bool Pkcs11Module::hasSlots() const {
    const auto all = slots(false);
    return all && !all->empty();
}

std::optional<Pkcs11Session> Pkcs11Module::openSession(CK_SLOT_ID slot) const {
    CK_SESSION_HANDLE session = 0;
    if (_module->C_OpenSession(slot, CKF_SERIAL_SESSION, nullptr, nullptr, &session) != CKR_OK)
        return {};
    return Pkcs11Session(_module, session);
}

bool Pkcs11Module::offers(CK_SLOT_ID slot, CK_MECHANISM_TYPE mechanism, CK_FLAGS what) const {
    CK_MECHANISM_INFO info = {};
    return _module->C_GetMechanismInfo(slot, mechanism, &info) == CKR_OK &&
           (info.flags & what) != 0;
}

}  // namespace vlm::service
