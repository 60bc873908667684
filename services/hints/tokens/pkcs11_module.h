// One PKCS#11 module, loaded into this process, behind an interface that believes none of its
// lengths and counts. Used in the worker process only: the module is foreign code.

#pragma once

#include <p11-kit/pkcs11.h>

#include <initializer_list>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/types.h"
#include "services/hints/tokens/token_identifier.h"

namespace vlm::service {

using platform::Bytes;

inline constexpr std::size_t kMostSlots = 1024;
inline constexpr std::size_t kMostObjects = 4096;  // on one token

// A result code for people: a sentence, and its number.
std::string resultText(CK_RV result);

// The values of some attributes of one object.
class Attributes {
public:
    std::optional<Bytes> bytes(CK_ATTRIBUTE_TYPE type) const;
    std::string text(CK_ATTRIBUTE_TYPE type) const;  // empty when there is none
    std::optional<CK_ULONG> number(CK_ATTRIBUTE_TYPE type) const;
    bool flag(CK_ATTRIBUTE_TYPE type) const;  // false when there is none

private:
    friend class Pkcs11Session;
    std::map<CK_ATTRIBUTE_TYPE, Bytes> _values;
};

// An open session; closed at the end of its life.
class Pkcs11Session {
public:
    Pkcs11Session(CK_FUNCTION_LIST* module, CK_SESSION_HANDLE handle)
        : _module(module), _handle(handle) {}
    Pkcs11Session(Pkcs11Session&& other) noexcept;
    Pkcs11Session& operator=(Pkcs11Session&& other) noexcept;
    ~Pkcs11Session();

    CK_FUNCTION_LIST* module() const { return _module; }
    CK_SESSION_HANDLE handle() const { return _handle; }
    bool isValid() const;

    // All objects that match the template; none when the token fails or has too many.
    std::optional<std::vector<CK_OBJECT_HANDLE>> find(std::vector<CK_ATTRIBUTE> pattern) const;

    // What the object tells of these attributes; those that it does not have are left out.
    Attributes read(CK_OBJECT_HANDLE object, std::initializer_list<CK_ATTRIBUTE_TYPE> types) const;

private:
    CK_FUNCTION_LIST* _module;
    CK_SESSION_HANDLE _handle;
};

struct SlotToken {
    CK_SLOT_ID slot = 0;
    CK_RV result = CKR_OK;  // when it is not, the token's fields are empty
    CK_FLAGS flags = 0;
    TokenFields fields;
};

class Pkcs11Module {
public:
    // Loads and initialises the module; null, with the reason, when it cannot be.
    static std::unique_ptr<Pkcs11Module> load(const std::string& path, std::string* reason);
    ~Pkcs11Module();
    Pkcs11Module(const Pkcs11Module&) = delete;
    Pkcs11Module& operator=(const Pkcs11Module&) = delete;

    // Ends and begins the module's work; its sessions are gone after that. A module that does not
    // begin again answers nothing from then on.
    void reinitialize();

    // The slots that hold a token, and the tokens, whatever state they are in; none when the
    // module does not tell its slots.
    std::optional<std::vector<SlotToken>> tokens() const;
    SlotToken tokenIn(CK_SLOT_ID slot) const;

    // Whether no slot stands for a machine's device: nothing announces a new token then.
    bool isSoftware() const;
    bool hasSlots() const;

    std::optional<Pkcs11Session> openSession(CK_SLOT_ID slot) const;
    // Whether the slot's token does it; what for is a flag like CKF_SIGN.
    bool offers(CK_SLOT_ID slot, CK_MECHANISM_TYPE mechanism, CK_FLAGS what) const;

private:
    explicit Pkcs11Module(CK_FUNCTION_LIST* module) : _module(module) {}
    std::optional<std::vector<CK_SLOT_ID>> slots(bool withToken) const;

    CK_FUNCTION_LIST* _module;
};

}  // namespace vlm::service
