// PairingStore: which account is paired with which public keys.
//
// Shapes:    one hash may serve several accounts, one account may have several hashes. Which of an
//            account's pairings is the latest is told by a number that only grows, since a clock
//            can be set back.
// Threads:   one.
// Blocking:  for the disk only; a pairing is on disk when pair() returns.
// Errors:    status kStoreFailed with a text.
// Behind it: services/hints/sqlite_pairing_store.h
// In tests:  tests/fakes/fake_pairing_store.h, tests/unit/services/pairing_store_test.cpp

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/types.h"
#include "services/hints/outcome.h"

namespace vlm::service {

struct Pairing {
    std::string account;
    platform::Bytes hash;
    std::int64_t sequence = 0;  // later pairings have larger numbers
    std::int64_t pairedAt = 0;  // seconds since 1970-01-01 00:00:00 UTC

    bool operator==(const Pairing&) const = default;
};

class PairingStore {
public:
    virtual ~PairingStore() = default;

    // Pairs the account with the key. A pair that is there already becomes the latest.
    virtual std::optional<Refusal> pair(const std::string& account, const platform::Bytes& hash,
                                        std::int64_t now) = 0;

    // Whether there was such a pairing.
    virtual Outcome<bool> unpair(const std::string& account, const platform::Bytes& hash) = 0;

    // The pairings of one account, and those with one key, the latest first.
    virtual Outcome<std::vector<Pairing>> pairingsOf(const std::string& account) = 0;
    virtual Outcome<std::vector<Pairing>> pairingsWith(const platform::Bytes& hash) = 0;

    virtual Outcome<bool> isPaired(const std::string& account) = 0;
};

}  // namespace vlm::service
