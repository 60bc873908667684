#include "services/hints/certificate_trust.h"

#include <algorithm>

#include "platform/text.h"
#include "services/hints/status.h"
#include "services/hints/tokens/openssl_time.h"
#include "services/hints/tokens/signature.h"

namespace vlm::service {

namespace {

using platform::text;

// More than the cards of any machine; what comes and goes must not fill the memory.
constexpr std::size_t kMostVerdicts = 8192;

X509Handle decode(const Bytes& der) {
    const unsigned char* at = der.data();
    X509Handle certificate(d2i_X509(nullptr, &at, static_cast<long>(der.size())));
    return at == der.data() + der.size() ? std::move(certificate) : nullptr;
}

std::vector<X509Handle> decodeAll(const std::vector<Bytes>& certificates) {
    std::vector<X509Handle> decoded;
    for (const auto& der : certificates)
        if (auto certificate = decode(der)) decoded.push_back(std::move(certificate));
    return decoded;
}

// The card's module tells the key and the certificate one by one, and is not believed.
bool isFor(const X509* certificate, const Bytes& publicKeyHash) {
    EVP_PKEY* key = X509_get0_pubkey(certificate);
    unsigned char* der = nullptr;
    const int size = key == nullptr ? 0 : i2d_PUBKEY(key, &der);
    if (size <= 0) return false;
    const Bytes hash = sha256(std::span(der, static_cast<std::size_t>(size)));
    OPENSSL_free(der);
    return hash == publicKeyHash;
}

// What a verdict is about: the certificate, and what may lead from it to an issuer.
Bytes digestOf(const Identity& identity, const Token& token) {
    Bytes digests = sha256(identity.certificate);
    digests.insert(digests.end(), identity.publicKeyHash.begin(), identity.publicKeyHash.end());
    for (const auto& other : token.otherCertificates) {
        const Bytes digest = sha256(other);
        digests.insert(digests.end(), digest.begin(), digest.end());
    }
    return sha256(digests);
}

// The next time after this one at which one of the certificates begins or ends to count.
std::int64_t nextDate(const X509* certificate, std::int64_t now, std::int64_t next) {
    for (const auto* date : {X509_get0_notBefore(certificate), X509_get0_notAfter(certificate)})
        if (const auto seconds = secondsOf(date); seconds && *seconds > now)
            next = std::min(next, *seconds);
    return next;
}

}  // namespace

std::optional<Refusal> whyNotTrusted(const Identity& identity, std::int64_t now) {
    const auto refusal = [&identity](std::string_view why) {
        return Refusal{
            status::kCertificateRefused,
            text("The certificate \"{}\" is not good for a login: {}.", identity.name, why)};
    };
    if (now < identity.notBefore) return refusal("it is not yet valid");
    if (now > identity.notAfter) return refusal("it has expired");
    if (!identity.distrust.empty()) return refusal(identity.distrust);
    return std::nullopt;
}

void CertificateTrust::judge(std::vector<Token>& tokens, const MachineAnchors& machine,
                             std::int64_t now) {
    const QuietErrors quiet;
    refresh(machine);
    for (auto& token : tokens)
        for (auto& identity : token.identities)
            identity.distrust = verdictOn(identity, token, now).whyNot;
}

void CertificateTrust::refresh(const MachineAnchors& machine) {
    if (const bool isNew = _folder.refresh(); !isNew && _verifier && machine == _machine) return;
    _machine = machine;
    _verifier.emplace(_folder.files(), _machine);
    _verdicts.clear();
}

const CertificateTrust::Verdict& CertificateTrust::verdictOn(const Identity& identity,
                                                             const Token& token, std::int64_t now) {
    const auto digest = digestOf(identity, token);
    const auto known = _verdicts.find(digest);
    if (known != _verdicts.end() && known->second.from <= now && now < known->second.until)
        return known->second;
    if (_verdicts.size() >= kMostVerdicts) _verdicts.clear();
    return _verdicts[digest] = judge(identity, token, now);
}

CertificateTrust::Verdict CertificateTrust::judge(const Identity& identity, const Token& token,
                                                  std::int64_t now) const {
    Verdict verdict{{}, now, _verifier->nextDate(now)};
    const auto certificate = decode(identity.certificate);
    if (!certificate) {
        verdict.whyNot = "it is too large, or cannot be read";
    } else if (!isFor(certificate.get(), identity.publicKeyHash)) {
        verdict.whyNot = "it is for another key than the card's";
    } else {
        const auto others = decodeAll(token.otherCertificates);
        verdict.whyNot = _verifier->whyNot(certificate.get(), others, now);
        verdict.until = nextDate(certificate.get(), now, verdict.until);
        for (const auto& other : others) verdict.until = nextDate(other.get(), now, verdict.until);
    }
    return verdict;
}

}  // namespace vlm::service
