#pragma once

#include <openssl/asn1.h>

#include <cstdint>
#include <ctime>
#include <optional>

namespace vlm::service {

// In seconds since 1970-01-01 00:00:00 UTC; none for what is no time.
inline std::optional<std::int64_t> secondsOf(const ASN1_TIME* time) {
    std::tm parts = {};
    if (time == nullptr || ASN1_TIME_to_tm(time, &parts) != 1) return {};
    return timegm(&parts);
}

}  // namespace vlm::service
