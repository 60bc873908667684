#include "services/hints/tokens/raw_signature.h"

#include "services/hints/tokens/openssl_handles.h"
#include "services/hints/tokens/signature.h"

namespace vlm::service {

Bytes signatureInput(const CertificateFacts& facts, std::span<const std::uint8_t> challenge) {
    Bytes digest = sha256(challenge);
    if (facts.keyKind == KeyKind::Ec) {
        if (digest.size() > facts.publicNumber.size()) digest.resize(facts.publicNumber.size());
        return digest;
    }
    // DigestInfo of RFC 8017, 9.2: the algorithm SHA-256 and room for its 32 bytes.
    Bytes input = {0x30, 0x31, 0x30, 0x0D, 0x06, 0x09, 0x60, 0x86, 0x48, 0x01,
                   0x65, 0x03, 0x04, 0x02, 0x01, 0x05, 0x00, 0x04, 0x20};
    input.insert(input.end(), digest.begin(), digest.end());
    return input;
}

Bytes ecdsaSignatureDer(std::span<const std::uint8_t> numbers) {
    const std::size_t half = numbers.size() / 2;
    if (half == 0 || numbers.size() % 2 != 0) return {};
    const EcdsaSignature signature(ECDSA_SIG_new());
    BignumHandle r(BN_bin2bn(numbers.data(), static_cast<int>(half), nullptr));
    BignumHandle s(BN_bin2bn(numbers.data() + half, static_cast<int>(half), nullptr));
    if (!signature || !r || !s || ECDSA_SIG_set0(signature.get(), r.get(), s.get()) != 1) return {};
    // The signature owns them now.
    static_cast<void>(r.release());
    static_cast<void>(s.release());
    const int size = i2d_ECDSA_SIG(signature.get(), nullptr);
    if (size <= 0) return {};
    Bytes der(static_cast<std::size_t>(size));
    unsigned char* end = der.data();
    i2d_ECDSA_SIG(signature.get(), &end);
    return der;
}

}  // namespace vlm::service
