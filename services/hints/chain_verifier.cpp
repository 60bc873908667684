#include "services/hints/chain_verifier.h"

#include <openssl/x509_vfy.h>

#include <algorithm>
#include <limits>
#include <utility>

#include "platform/text.h"
#include "services/hints/sign_in_usage.h"
#include "services/hints/tokens/openssl_time.h"
#include "services/hints/verify_error.h"

namespace vlm::service {

namespace {

using platform::Bytes;
using Context = std::unique_ptr<X509_STORE_CTX, OpensslFree<X509_STORE_CTX_free>>;

constexpr int kMostIssuers = 10;
constexpr int kSecurityLevel = 2;  // 112 bits: RSA from 2048, no SHA-1

Bytes derOf(X509* certificate) {
    unsigned char* der = nullptr;
    const int size = i2d_X509(certificate, &der);
    if (size <= 0) return {};
    Bytes bytes(der, der + size);
    OPENSSL_free(der);
    return bytes;
}

// An anchor is the last of its path.
bool isAnchor(const X509_STORE_CTX* context) {
    return X509_STORE_CTX_get_error_depth(context) + 1 ==
           sk_X509_num(X509_STORE_CTX_get0_chain(context));
}

void addDates(const ASN1_TIME* from, const ASN1_TIME* until, std::set<std::int64_t>& dates) {
    for (const auto& date : {secondsOf(from), secondsOf(until)})
        if (date) dates.insert(*date);
}

}  // namespace

ChainVerifier::ChainVerifier(const TrustFiles& files, const MachineAnchors& machine)
    : _files(files),
      _distrusted(machine.distrusted.begin(), machine.distrusted.end()),
      _anchors(sk_X509_new_null()),
      _store(X509_STORE_new()) {
    const QuietErrors quiet;
    for (const Bytes& der : machine.trusted) {
        const unsigned char* at = der.data();
        if (X509Handle anchor{d2i_X509(nullptr, &at, static_cast<long>(der.size()))})
            _machineAnchors.push_back(std::move(anchor));
    }
    for (const auto* anchors : {&_files.anchors, &std::as_const(_machineAnchors)})
        for (const auto& anchor : *anchors) sk_X509_push(_anchors.get(), anchor.get());
    for (const auto* certificates :
         {&_files.anchors, &_files.intermediates, &std::as_const(_machineAnchors)})
        for (const auto& each : *certificates)
            addDates(X509_get0_notBefore(each.get()), X509_get0_notAfter(each.get()), _dates);
    for (const auto& list : _files.lists) {
        _lists.emplace(X509_CRL_get_issuer(list.get()), list.get());
        addDates(X509_CRL_get0_lastUpdate(list.get()), X509_CRL_get0_nextUpdate(list.get()),
                 _dates);
    }
    if (_store) X509_STORE_set_lookup_crls(_store.get(), listsFor);
}

std::string ChainVerifier::whyNot(X509* certificate, const std::vector<X509Handle>& others,
                                  std::int64_t now) const {
    const QuietErrors quiet;
    if (!_files.unusableList.empty())
        return "whether it is revoked cannot be told: " + _files.unusableList;

    const Stack issuers(sk_X509_new_null());
    for (const auto* some : {&others, &_files.intermediates})
        for (const auto& issuer : *some) sk_X509_push(issuers.get(), issuer.get());
    const Context context(X509_STORE_CTX_new());
    if (!_store || !_anchors || !issuers || !context ||
        X509_STORE_CTX_init(context.get(), _store.get(), certificate, issuers.get()) != 1)
        return "there is no memory to check it";

    X509_STORE_CTX_set0_trusted_stack(context.get(), _anchors.get());
    X509_STORE_CTX_set_app_data(context.get(), const_cast<ChainVerifier*>(this));
    X509_STORE_CTX_set_verify_cb(context.get(), judge);
    X509_VERIFY_PARAM* rules = X509_STORE_CTX_get0_param(context.get());
    X509_VERIFY_PARAM_set_flags(
        rules, X509_V_FLAG_PARTIAL_CHAIN | X509_V_FLAG_CRL_CHECK | X509_V_FLAG_CRL_CHECK_ALL);
    X509_VERIFY_PARAM_set_depth(rules, kMostIssuers);
    X509_VERIFY_PARAM_set_auth_level(rules, kSecurityLevel);
    X509_VERIFY_PARAM_set_time(rules, now);
    if (X509_verify_cert(context.get()) != 1)
        return verifyErrorText(X509_STORE_CTX_get_error(context.get()),
                               X509_STORE_CTX_get_error_depth(context.get()));
    return whyNotTrustedPath(X509_STORE_CTX_get0_chain(context.get()));
}

// Lets pass what is no error here: an issuer without any list, and an anchor without a list of who
// issued it.
int ChainVerifier::judge(int isGood, X509_STORE_CTX* context) {
    if (isGood == 1 || X509_STORE_CTX_get_error(context) != X509_V_ERR_UNABLE_TO_GET_CRL)
        return isGood;
    if (isAnchor(context)) return 1;
    const auto* self = static_cast<const ChainVerifier*>(X509_STORE_CTX_get_app_data(context));
    const X509* certificate = X509_STORE_CTX_get_current_cert(context);
    return self->_lists.contains(X509_get_issuer_name(certificate)) ? 0 : 1;
}

STACK_OF(X509_CRL) * ChainVerifier::listsFor(const X509_STORE_CTX* context,
                                             const X509_NAME* issuer) {
    STACK_OF(X509_CRL)* lists = sk_X509_CRL_new_null();
    if (lists == nullptr || isAnchor(context)) return lists;
    const auto* self = static_cast<const ChainVerifier*>(X509_STORE_CTX_get_app_data(context));
    const auto [first, end] = self->_lists.equal_range(issuer);
    for (auto each = first; each != end; ++each)
        if (X509_CRL_up_ref(each->second) == 1) sk_X509_CRL_push(lists, each->second);
    return lists;
}

std::string ChainVerifier::whyNotTrustedPath(STACK_OF(X509) * path) const {
    const int size = sk_X509_num(path);
    for (int i = 0; i < size; ++i) {
        X509* each = sk_X509_value(path, i);
        if (!_distrusted.empty() && _distrusted.contains(derOf(each)))
            return i == 0 ? "this machine distrusts it" : "this machine distrusts an issuer of it";
    }
    if (!maySign(sk_X509_value(path, 0)) || !isMeantForSigningIn(sk_X509_value(path, 0)))
        return "it is not meant for signing in";
    for (int i = 1; i + 1 < size; ++i)
        if (!isMeantForSigningIn(sk_X509_value(path, i)))
            return "its issuer may not issue certificates for signing in";
    return {};
}

std::int64_t ChainVerifier::nextDate(std::int64_t now) const {
    const auto next = _dates.upper_bound(now);
    return next == _dates.end() ? std::numeric_limits<std::int64_t>::max() : *next;
}

}  // namespace vlm::service
