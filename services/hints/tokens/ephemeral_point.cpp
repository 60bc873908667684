#include "services/hints/tokens/ephemeral_point.h"

#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {

bool isPointForKey(std::span<const std::uint8_t> point,
                   std::span<const std::uint8_t> publicKeyInfo) {
    constexpr std::uint8_t kUncompressed = 4;
    if (point.empty() || point.front() != kUncompressed) return false;
    const QuietErrors quiet;
    const unsigned char* start = publicKeyInfo.data();
    const KeyHandle key(d2i_PUBKEY(nullptr, &start, static_cast<long>(publicKeyInfo.size())));
    const KeyHandle other(EVP_PKEY_new());
    if (!key || EVP_PKEY_get_base_id(key.get()) != EVP_PKEY_EC || !other ||
        EVP_PKEY_copy_parameters(other.get(), key.get()) != 1 ||
        EVP_PKEY_set1_encoded_public_key(other.get(), point.data(), point.size()) != 1)
        return false;
    const KeyContext context(EVP_PKEY_CTX_new(other.get(), nullptr));
    return context && EVP_PKEY_public_check(context.get()) == 1;
}

}  // namespace vlm::service
