#include "services/hints/tokens/identities.h"

#include <algorithm>
#include <map>
#include <span>
#include <tuple>

namespace vlm::service {
namespace {

using Octets = std::span<const std::uint8_t>;

// An elliptic-curve point by its first coordinate, compressed or not; `point` may stand in a DER
// octet string, as it should, or bare, as some modules have it.
SameKey samePoint(Octets point, Octets coordinate) {
    const auto isPoint = [&coordinate](Octets octets) {
        const std::size_t size = coordinate.size();
        return (octets.size() == 1 + 2 * size && octets[0] == 4) ||
               (octets.size() == 1 + size && (octets[0] == 2 || octets[0] == 3));
    };
    const auto compare = [&coordinate](Octets octets) {
        const bool same = std::ranges::equal(octets.subspan(1, coordinate.size()), coordinate);
        return same ? SameKey::Yes : SameKey::No;
    };
    if (isPoint(point)) return compare(point);
    for (const std::size_t header : {2U, 3U})  // one and two length bytes
        if (point.size() > header && point[0] == 4 && isPoint(point.subspan(header)))
            return compare(point.subspan(header));
    return SameKey::No;
}

struct KeyAbilities {
    bool signs = false;
    bool wraps = false;
};

// What the key behind the certificate can do; none when there is no such key on the token.
std::optional<KeyAbilities> keyBehind(const CertificateObject& certificate,
                                      const TokenObjects& objects, bool needsLogin) {
    if (!objects.showsKeys && needsLogin) return KeyAbilities{true, true};

    std::optional<KeyAbilities> byPrivate;
    std::optional<KeyAbilities> byPublic;
    for (const KeyObject& key : objects.keys) {
        const SameKey same = sameKey(key, certificate.facts);
        if (key.id != certificate.id || same == SameKey::No) continue;
        if (key.id.empty() && same == SameKey::Untold) continue;
        std::optional<KeyAbilities>& abilities = key.isPrivate ? byPrivate : byPublic;
        if (!abilities) abilities.emplace();
        abilities->signs |= key.signs;
        abilities->wraps |= key.wraps;
    }
    // Without a login to hide it, a private key that is not seen is not there.
    return byPrivate || !needsLogin ? byPrivate : byPublic;
}

// Puts the certificate that stands for a key in front of another one on the same key.
// The last ranks only make the choice independent of the order in which the module lists them.
bool standsBefore(const CertificateObject& one, const CertificateObject& other, std::int64_t now) {
    const auto rank = [now](const CertificateObject& certificate) {
        const CertificateFacts& facts = certificate.facts;
        return std::tuple(facts.validAt(now), facts.notBefore, facts.notAfter, facts.maySign,
                          facts.mayWrap, std::string_view(facts.name),
                          std::string_view(certificate.label));
    };
    return rank(one) > rank(other);
}

struct Candidate {
    const CertificateObject* certificate;
    KeyAbilities key;
};

std::optional<WrapScheme> schemeFor(KeyKind kind, const WrapMechanisms& mechanisms) {
    if (kind == KeyKind::Ec)
        return mechanisms.ecdh ? std::optional(WrapScheme::Ecdh) : std::nullopt;
    if (mechanisms.oaep) return WrapScheme::RsaOaepSha256;
    return mechanisms.pkcs1 ? std::optional(WrapScheme::RsaPkcs1) : std::nullopt;
}

// RSA goes before EC, but its old padding only where a card can do no other.
int rankOf(WrapScheme scheme) {
    switch (scheme) {
        case WrapScheme::RsaOaepSha256:
            return 0;
        case WrapScheme::Ecdh:
            return 1;
        case WrapScheme::RsaPkcs1:
            return 2;
    }
    return 3;
}

// Called with the smallest hash first, which stays the choice among keys of one rank.
void offerWrapKey(const Candidate& candidate, const WrapMechanisms& mechanisms, Token& token) {
    const CertificateFacts& facts = candidate.certificate->facts;
    const auto scheme = schemeFor(facts.keyKind, mechanisms);
    if (!scheme || !facts.mayWrap || !candidate.key.wraps) return;
    if (token.wrapKeyHash && rankOf(token.wrapScheme) <= rankOf(*scheme)) return;
    token.wrapKeyHash = facts.publicKeyHash;
    token.wrapScheme = *scheme;
}

}  // namespace

SameKey sameKey(const KeyObject& key, const CertificateFacts& certificate) {
    if (key.kind != certificate.keyKind) return SameKey::No;
    if (key.publicPart.empty()) return SameKey::Untold;
    Octets part = key.publicPart;
    if (key.kind == KeyKind::Ec) return samePoint(part, certificate.publicNumber);
    while (!part.empty() && part.front() == 0) part = part.subspan(1);
    return std::ranges::equal(part, certificate.publicNumber) ? SameKey::Yes : SameKey::No;
}

void addIdentities(const TokenObjects& objects, std::int64_t now, Token& token) {
    std::map<Bytes, Candidate> byHash;
    for (const CertificateObject& certificate : objects.certificates) {
        const auto key = keyBehind(certificate, objects, token.needsLogin);
        if (!key) continue;
        const auto [place, isNew] =
            byHash.try_emplace(certificate.facts.publicKeyHash, Candidate{&certificate, *key});
        if (!isNew && standsBefore(certificate, *place->second.certificate, now))
            place->second = {&certificate, *key};
    }

    for (const auto& [hash, candidate] : byHash) {
        const CertificateFacts& facts = candidate.certificate->facts;
        Identity identity;
        identity.publicKeyHash = hash;
        identity.publicKeyInfo = facts.publicKeyInfo;
        identity.name = facts.name.empty() ? candidate.certificate->label : facts.name;
        identity.notBefore = facts.notBefore;
        identity.notAfter = facts.notAfter;
        identity.canSign = facts.maySign && candidate.key.signs;
        identity.certificate = candidate.certificate->der;
        token.identities.push_back(std::move(identity));
        offerWrapKey(candidate, objects.wrapMechanisms, token);
    }

    for (const CertificateObject& certificate : objects.certificates)
        if (!byHash.contains(certificate.facts.publicKeyHash))
            token.otherCertificates.push_back(certificate.der);
}

}  // namespace vlm::service
