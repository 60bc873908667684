#include "services/hints/certificate_trust.h"

#include <algorithm>
#include <utility>

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

void append(const Bytes& some, Bytes& all) { all.insert(all.end(), some.begin(), some.end()); }

// The next time after this one at which one of the certificates begins or ends to count.
std::int64_t nextDate(const X509* certificate, std::int64_t now, std::int64_t next) {
    for (const auto* date : {X509_get0_notBefore(certificate), X509_get0_notAfter(certificate)})
        if (const auto seconds = secondsOf(date); seconds && *seconds > now)
            next = std::min(next, *seconds);
    return next;
}

}  // namespace

// A card may hold thousands of identities beside them, so they are taken apart once, and only when
// one of those is judged anew.
class CertificateTrust::Others {
public:
    explicit Others(const std::vector<Bytes>& certificates) : _encoded(certificates) {
        Bytes digests;
        for (const auto& der : _encoded) append(sha256(der), digests);
        _digest = sha256(digests);
    }

    const Bytes& digest() const { return _digest; }
    const std::vector<X509Handle>& certificates() {
        if (std::exchange(_isDecoded, true)) return _decoded;
        for (const auto& der : _encoded)
            if (auto certificate = decode(der)) _decoded.push_back(std::move(certificate));
        return _decoded;
    }

private:
    const std::vector<Bytes>& _encoded;
    Bytes _digest;
    bool _isDecoded = false;
    std::vector<X509Handle> _decoded;
};

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
    for (auto& token : tokens) {
        Others others(token.otherCertificates);
        for (auto& identity : token.identities)
            identity.distrust = verdictOn(identity, others, now).whyNot;
    }
}

void CertificateTrust::refresh(const MachineAnchors& machine) {
    if (const bool isNew = _folder.refresh(); !isNew && _verifier && machine == _machine) return;
    _machine = machine;
    _verifier.emplace(_folder.files(), _machine);
    _verdicts.clear();
}

const CertificateTrust::Verdict& CertificateTrust::verdictOn(const Identity& identity,
                                                             Others& others, std::int64_t now) {
    Bytes judged = sha256(identity.certificate);
    append(identity.publicKeyHash, judged);
    append(others.digest(), judged);
    const auto digest = sha256(judged);
    const auto known = _verdicts.find(digest);
    if (known != _verdicts.end() && known->second.from <= now && now < known->second.until)
        return known->second;
    if (_verdicts.size() >= kMostVerdicts) _verdicts.clear();
    return _verdicts[digest] = judge(identity, others, now);
}

CertificateTrust::Verdict CertificateTrust::judge(const Identity& identity, Others& others,
                                                  std::int64_t now) const {
    Verdict verdict{{}, now, _verifier->nextDate(now)};
    const auto certificate = decode(identity.certificate);
    if (!certificate) {
        verdict.whyNot = "it is too large, or cannot be read";
    } else if (!isFor(certificate.get(), identity.publicKeyHash)) {
        verdict.whyNot = "it is for another key than the card's";
    } else {
        verdict.whyNot = _verifier->whyNot(certificate.get(), others.certificates(), now);
        verdict.until = nextDate(certificate.get(), now, verdict.until);
        for (const auto& other : others.certificates())
            verdict.until = nextDate(other.get(), now, verdict.until);
    }
    return verdict;
}

}  // namespace vlm::service
