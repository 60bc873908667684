// OpenSSL has this by itself in its older interface only; the newer one wants the private key for
// it.
#define OPENSSL_SUPPRESS_DEPRECATED

#include "services/hints/tokens/oaep_padding.h"

#include <openssl/rsa.h>

#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {

std::optional<Secret> withoutOaepPadding(const Secret& block, std::size_t modulusBytes) {
    const QuietErrors quiet;
    if (block.empty() || block.octets().size() > modulusBytes) return {};
    auto content = Secret::ofSize(modulusBytes);
    const int size = RSA_padding_check_PKCS1_OAEP_mgf1(
        content.octets().data(), static_cast<int>(modulusBytes), block.octets().data(),
        static_cast<int>(block.octets().size()), static_cast<int>(modulusBytes), nullptr, 0,
        EVP_sha256(), EVP_sha256());
    if (size < 0) return {};
    content.shorten(static_cast<std::size_t>(size));
    return content;
}

}  // namespace vlm::service
