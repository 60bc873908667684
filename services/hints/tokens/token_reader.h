// Reads what matters off one token: its state, its certificates, and what its keys show.

#pragma once

#include <optional>
#include <string>

#include "services/hints/tokens.h"
#include "services/hints/tokens/identities.h"
#include "services/hints/tokens/pkcs11_module.h"

namespace vlm::service {

// The token without its identities.
Token describeToken(const SlotToken& token);

PinState pinStateOf(CK_FLAGS tokenFlags);

// Certificates that cannot be read and keys of other kinds are left out; none when the token
// itself cannot be read.
std::optional<TokenObjects> readObjects(const Pkcs11Session& session);

// What the token offers for opening what was wrapped.
WrapMechanisms wrapMechanismsIn(const Pkcs11Module& module, CK_SLOT_ID slot);

// One key object; none for a key that is neither RSA nor EC.
std::optional<KeyObject> readKey(const Pkcs11Session& session, CK_OBJECT_HANDLE object,
                                 bool isPrivate);

// Objects of one class, and, when they are given, of one kind of key and one id.
std::optional<std::vector<CK_OBJECT_HANDLE>> findClass(const Pkcs11Session& session,
                                                       CK_OBJECT_CLASS objectClass);
std::optional<std::vector<CK_OBJECT_HANDLE>> findPrivateKeys(const Pkcs11Session& session,
                                                             KeyKind kind, const Bytes& id);

}  // namespace vlm::service
