#include "services/keychain/wrapped_form.h"

#include <algorithm>
#include <array>

namespace vlm::service {
namespace {

using Octets = std::span<const std::uint8_t>;

constexpr std::array<std::uint8_t, 4> kMagic = {'V', 'L', 'M', 'K'};
constexpr std::uint8_t kVersion = 1;
constexpr std::size_t kHeaderBytes = kMagic.size() + 4;  // version, scheme, size of the sealed part
constexpr std::size_t kRestBytes = kNonceBytes + kPaddedBytes + kTagBytes;

bool isScheme(std::uint8_t number) {
    return number >= static_cast<std::uint8_t>(WrapScheme::RsaOaepSha256) &&
           number <= static_cast<std::uint8_t>(WrapScheme::Ecdh);
}

// The first size that an RSA key of 2048 bits encrypts to; an uncompressed point with its mark and
// two coordinates.
bool canBeSealed(WrapScheme scheme, Octets sealed) {
    constexpr std::size_t kSmallestCiphertext = 256;
    if (kHeaderBytes + sealed.size() + kRestBytes > kMostWrappedBytes) return false;
    if (scheme != WrapScheme::Ecdh) return sealed.size() >= kSmallestCiphertext;
    return sealed.size() > 1 && sealed.size() % 2 == 1 && sealed.front() == 4;
}

void append(Bytes& bytes, Octets more) { bytes.insert(bytes.end(), more.begin(), more.end()); }

void appendWithSize(Bytes& bytes, Octets part) {
    for (const unsigned shift : {24U, 16U, 8U, 0U})
        bytes.push_back(static_cast<std::uint8_t>(part.size() >> shift));
    append(bytes, part);
}

}  // namespace

std::optional<WrappedForm> readWrappedForm(std::span<const std::uint8_t> wrapped) {
    if (wrapped.size() < kHeaderBytes + kRestBytes || wrapped.size() > kMostWrappedBytes) return {};
    const auto header = wrapped.first(kHeaderBytes);
    if (!std::ranges::equal(header.first(kMagic.size()), kMagic) || header[4] != kVersion ||
        !isScheme(header[5]))
        return {};
    const std::size_t sealedBytes = std::size_t{header[6]} << 8U | header[7];
    if (wrapped.size() != kHeaderBytes + sealedBytes + kRestBytes) return {};

    WrappedForm form;
    form.scheme = WrapScheme{header[5]};
    form.sealed = wrapped.subspan(kHeaderBytes, sealedBytes);
    form.front = wrapped.first(kHeaderBytes + sealedBytes + kNonceBytes);
    form.nonce = form.front.last(kNonceBytes);
    form.ciphertext = wrapped.subspan(form.front.size(), kPaddedBytes);
    form.tag = wrapped.last(kTagBytes);
    if (!canBeSealed(form.scheme, form.sealed)) return {};
    return form;
}

std::optional<Bytes> wrappedFront(WrapScheme scheme, const Bytes& sealed,
                                  std::span<const std::uint8_t, kNonceBytes> nonce) {
    if (!canBeSealed(scheme, sealed)) return {};
    Bytes front(kMagic.begin(), kMagic.end());
    front.push_back(kVersion);
    front.push_back(static_cast<std::uint8_t>(scheme));
    front.push_back(static_cast<std::uint8_t>(sealed.size() >> 8U));
    front.push_back(static_cast<std::uint8_t>(sealed.size()));
    append(front, sealed);
    append(front, nonce);
    return front;
}

Bytes associatedData(std::span<const std::uint8_t> front, const UnlockKeyPurpose& purpose) {
    Bytes data;
    appendWithSize(data, front);
    appendWithSize(data, Bytes(purpose.account.begin(), purpose.account.end()));
    appendWithSize(data, purpose.publicKeyHash);
    appendWithSize(data, purpose.wrapKeyHash);
    return data;
}

}  // namespace vlm::service
