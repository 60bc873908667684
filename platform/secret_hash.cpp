#include "platform/secret_hash.h"

#include <chrono>
#include <exception>
#include <random>

namespace vlm::platform {

SecretHash::Secret SecretHash::makeSecret() {
    Secret secret{};
    try {
        std::random_device random;
        for (auto& part : secret) part = (std::uint64_t{random()} << 32U | random()) | 1U;
    } catch (const std::exception&) {
        // Without a source of randomness, what differs from one process to the next has to do.
        const auto place = reinterpret_cast<std::uintptr_t>(&secret);
        const auto now = std::chrono::steady_clock::now().time_since_epoch().count();
        std::mt19937_64 numbers(place ^ static_cast<std::uint64_t>(now));
        for (auto& part : secret) part = numbers() | 1U;
    }
    return secret;
}

const SecretHash::Secret& SecretHash::secretOfThisProcess() {
    static const Secret secret = makeSecret();
    return secret;
}

}  // namespace vlm::platform
