// ChainVerifier: whether a certificate may be used to log in, as far as its issuers say.
//
// A path of issuers has to lead to an anchor, each with the right to issue; nothing on it may be
// out of its dates, weak, distrusted or revoked. An anchor counts by itself, whoever issued it. A
// revocation list counts for all that its issuer has issued, also when it is out of date; an issuer
// without any list is not asked for one. The certificate has to be meant for signing in, and so has
// what its issuers issue, where that is said.
//
// Threads:  one. Blocking: no. Errors: sentences for people.
// In tests: tests/unit/services/trust/

#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "platform/types.h"
#include "services/hints/tokens/machine_anchors.h"
#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/trust_folder.h"

namespace vlm::service {

class ChainVerifier {
public:
    // The files outlive the verifier.
    ChainVerifier(const TrustFiles& files, const MachineAnchors& machine);
    ChainVerifier(const ChainVerifier&) = delete;
    ChainVerifier& operator=(const ChainVerifier&) = delete;

    // Why the certificate is not trusted at the time, in seconds since 1970-01-01 00:00:00 UTC;
    // empty when it is. The others may be issuers of it, and are no anchors.
    std::string whyNot(X509* certificate, const std::vector<X509Handle>& others,
                       std::int64_t now) const;

    // The next time after this one at which an anchor, an issuer or a list begins or ends to
    // count; far away when there is none.
    std::int64_t nextDate(std::int64_t now) const;

private:
    struct NameOrder {
        bool operator()(const X509_NAME* one, const X509_NAME* other) const {
            return X509_NAME_cmp(one, other) < 0;
        }
    };
    struct StackFree {
        void operator()(STACK_OF(X509) * stack) const { sk_X509_free(stack); }
    };
    // Holds what others own.
    using Stack = std::unique_ptr<STACK_OF(X509), StackFree>;

    static int judge(int isGood, X509_STORE_CTX* context);
    static STACK_OF(X509_CRL) * listsFor(const X509_STORE_CTX* context, const X509_NAME* issuer);
    std::string whyNotTrustedPath(STACK_OF(X509) * path) const;

    const TrustFiles& _files;
    std::vector<X509Handle> _machineAnchors;
    std::set<platform::Bytes> _distrusted;
    std::multimap<const X509_NAME*, X509_CRL*, NameOrder> _lists;
    std::set<std::int64_t> _dates;
    Stack _anchors;
    std::unique_ptr<X509_STORE, OpensslFree<X509_STORE_free>> _store;
};

}  // namespace vlm::service
