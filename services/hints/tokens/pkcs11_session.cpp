#include <algorithm>
#include <array>
#include <cstring>
#include <utility>

#include "services/hints/tokens/pkcs11_module.h"

namespace vlm::service {
namespace {

// More than any certificate, key or name on a card has.
constexpr CK_ULONG kMostBytes = 64UL * 1024;

bool isUsable(CK_ULONG size) { return size != CK_UNAVAILABLE_INFORMATION && size <= kMostBytes; }

}  // namespace

std::optional<Bytes> Attributes::bytes(CK_ATTRIBUTE_TYPE type) const {
    const auto value = _values.find(type);
    if (value == _values.end()) return {};
    return value->second;
}

std::string Attributes::text(CK_ATTRIBUTE_TYPE type) const {
    const auto value = _values.find(type);
    if (value == _values.end()) return {};
    return {value->second.begin(), value->second.end()};
}

std::optional<CK_ULONG> Attributes::number(CK_ATTRIBUTE_TYPE type) const {
    const auto value = _values.find(type);
    CK_ULONG number = 0;
    if (value == _values.end() || value->second.size() != sizeof number) return {};
    std::memcpy(&number, value->second.data(), sizeof number);
    return number;
}

bool Attributes::flag(CK_ATTRIBUTE_TYPE type) const {
    const auto value = _values.find(type);
    return value != _values.end() && value->second.size() == 1 && value->second[0] != CK_FALSE;
}

Pkcs11Session::Pkcs11Session(Pkcs11Session&& other) noexcept
    : _module(std::exchange(other._module, nullptr)), _handle(other._handle) {}

Pkcs11Session& Pkcs11Session::operator=(Pkcs11Session&& other) noexcept {
    std::swap(_module, other._module);
    std::swap(_handle, other._handle);
    return *this;
}

Pkcs11Session::~Pkcs11Session() {
    if (_module != nullptr) _module->C_CloseSession(_handle);
}

bool Pkcs11Session::isValid() const {
    CK_SESSION_INFO info = {};
    return _module->C_GetSessionInfo(_handle, &info) == CKR_OK;
}

std::optional<std::vector<CK_OBJECT_HANDLE>> Pkcs11Session::find(
    std::vector<CK_ATTRIBUTE> pattern) const {
    if (_module->C_FindObjectsInit(_handle, pattern.data(), pattern.size()) != CKR_OK) return {};
    std::vector<CK_OBJECT_HANDLE> objects;
    std::array<CK_OBJECT_HANDLE, 64> batch{};
    CK_RV result = CKR_OK;
    CK_ULONG count = 0;
    do {
        result = _module->C_FindObjects(_handle, batch.data(), batch.size(), &count);
        if (result != CKR_OK) break;
        count = std::min<CK_ULONG>(count, batch.size());
        objects.insert(objects.end(), batch.begin(), batch.begin() + count);
    } while (count > 0 && objects.size() <= kMostObjects);
    _module->C_FindObjectsFinal(_handle);
    if (result != CKR_OK || objects.size() > kMostObjects) return {};
    return objects;
}

Attributes Pkcs11Session::read(CK_OBJECT_HANDLE object,
                               std::initializer_list<CK_ATTRIBUTE_TYPE> types) const {
    std::vector<CK_ATTRIBUTE> wanted;
    for (const CK_ATTRIBUTE_TYPE type : types)
        wanted.push_back({type, nullptr, CK_UNAVAILABLE_INFORMATION});
    // Attributes that are hidden or missing make the call fail, and all the same it fills in the
    // lengths of the others.
    _module->C_GetAttributeValue(_handle, object, wanted.data(), wanted.size());
    std::erase_if(wanted, [](const CK_ATTRIBUTE& each) { return !isUsable(each.ulValueLen); });

    std::vector<Bytes> room;
    room.reserve(wanted.size());
    for (CK_ATTRIBUTE& each : wanted) each.pValue = room.emplace_back(each.ulValueLen).data();

    Attributes attributes;
    if (wanted.empty() ||
        _module->C_GetAttributeValue(_handle, object, wanted.data(), wanted.size()) != CKR_OK)
        return attributes;
    for (std::size_t i = 0; i < wanted.size(); ++i) {
        if (wanted[i].ulValueLen > room[i].size()) continue;
        room[i].resize(wanted[i].ulValueLen);
        attributes._values.emplace(wanted[i].type, std::move(room[i]));
    }
    return attributes;
}

}  // namespace vlm::service
