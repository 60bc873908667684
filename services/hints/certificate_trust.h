// CertificateTrust: which identities may be used to log in, where the setting
// "checkCertificateTrust" asks for certificates of issuers that the machine trusts.
//
// A verdict is kept for as long as nothing can have changed it: the files of the administrator, the
// machine's anchors, what else is on the card, and the dates of all of these.
//
// Threads:  one. Blocking: for the disk, for files that have changed.
// Errors:   a certificate that cannot be judged is not trusted.
// In tests: tests/unit/services/trust/

#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/chain_verifier.h"
#include "services/hints/outcome.h"
#include "services/hints/tokens.h"
#include "services/hints/trust_folder.h"

namespace vlm::service {

// Why nobody logs in with the identity now, with kCertificateRefused: it is out of its dates, or
// distrusted as the listing says. None when its certificate is good for that.
std::optional<Refusal> whyNotTrusted(const Identity& identity, std::int64_t now);

class CertificateTrust {
public:
    explicit CertificateTrust(TrustFolder folder = TrustFolder()) : _folder(std::move(folder)) {}

    // Fills in why identities are distrusted; `now` is in seconds since 1970-01-01 00:00:00 UTC.
    void judge(std::vector<Token>& tokens, const MachineAnchors& machine, std::int64_t now);

private:
    struct Verdict {
        std::string whyNot;
        std::int64_t from = 0;   // holds since then
        std::int64_t until = 0;  // and before then
    };

    class Others;  // the card's other certificates

    void refresh(const MachineAnchors& machine);
    const Verdict& verdictOn(const Identity& identity, Others& others, std::int64_t now);
    Verdict judge(const Identity& identity, Others& others, std::int64_t now) const;

    TrustFolder _folder;
    MachineAnchors _machine;
    std::optional<ChainVerifier> _verifier;
    std::map<Bytes, Verdict> _verdicts;  // by what was judged
};

}  // namespace vlm::service
