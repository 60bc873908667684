#include "services/hints/tokens/private_keys.h"

#include <algorithm>
#include <set>

#include "services/hints/tokens/token_reader.h"

namespace vlm::service {

CK_RV login(const Pkcs11Session& session, CK_USER_TYPE user, Secret& pin, bool hasPinPad) {
    return hasPinPad ? session.module()->C_Login(session.handle(), user, nullptr, 0)
                     : session.module()->C_Login(session.handle(), user, pin.octets().data(),
                                                 pin.octets().size());
}

const CertificateFacts* factsOf(const TokenObjects& objects, const Bytes& hash) {
    const auto found = std::ranges::find_if(objects.certificates, [&hash](const auto& each) {
        return each.facts.publicKeyHash == hash;
    });
    return found == objects.certificates.end() ? nullptr : &found->facts;
}

std::vector<PrivateKey> privateKeysOf(const Pkcs11Session& session, const TokenObjects& objects,
                                      const Bytes& hash) {
    std::vector<PrivateKey> keys;
    std::set<Bytes> ids;
    for (const CertificateObject& certificate : objects.certificates) {
        const CertificateFacts& facts = certificate.facts;
        if (facts.publicKeyHash != hash || !ids.insert(certificate.id).second) continue;
        const auto handles = findPrivateKeys(session, facts.keyKind, certificate.id);
        if (!handles) continue;
        for (const CK_OBJECT_HANDLE handle : *handles) {
            const auto key = readKey(session, handle, /*isPrivate=*/true);
            const SameKey same = key ? sameKey(*key, facts) : SameKey::No;
            if (same == SameKey::No) continue;
            const bool always =
                session.read(handle, {CKA_ALWAYS_AUTHENTICATE}).flag(CKA_ALWAYS_AUTHENTICATE);
            keys.push_back({handle, always, same});
        }
    }
    std::stable_partition(keys.begin(), keys.end(),
                          [](const PrivateKey& key) { return key.sameKey == SameKey::Yes; });
    keys.erase(keys.begin() + static_cast<std::ptrdiff_t>(std::min(keys.size(), kMostKeysTried)),
               keys.end());
    return keys;
}

}  // namespace vlm::service
