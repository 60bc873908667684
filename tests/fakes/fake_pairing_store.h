#pragma once

#include <algorithm>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/pairing_store.h"
#include "services/hints/status.h"
#include "services/hints/unlock_key_store.h"

namespace vlm::fakes {

class FakePairingStore final : public service::PairingStore, public service::UnlockKeyStore {
public:
    // What a test does to the world.
    void breakDown(const std::string& why) {
        _broken = service::Refusal{service::status::kStoreFailed, why};
    }

    // What is in it, the latest last.
    const std::vector<service::Pairing>& all() const { return _pairings; }

    std::optional<service::Refusal> pair(const std::string& account, const platform::Bytes& hash,
                                         std::int64_t now) override {
        if (_broken) return _broken;
        removePairing(account, hash);
        _pairings.push_back({account, hash, ++_last, now});
        return std::nullopt;
    }
    service::Outcome<bool> unpair(const std::string& account,
                                  const platform::Bytes& hash) override {
        if (_broken) return *_broken;
        removeUnlockKey(account, hash);
        return removePairing(account, hash);
    }
    service::Outcome<std::vector<service::Pairing>> pairingsOf(
        const std::string& account) override {
        return latestFirst([&](const auto& pairing) { return pairing.account == account; });
    }
    service::Outcome<std::vector<service::Pairing>> pairingsWith(
        const platform::Bytes& hash) override {
        return latestFirst([&](const auto& pairing) { return pairing.hash == hash; });
    }
    service::Outcome<bool> isPaired(const std::string& account) override {
        const auto found = pairingsOf(account);
        if (!found) return found.refusal();
        return !found->empty();
    }

    std::optional<service::Refusal> storeUnlockKey(const service::UnlockKey& key) override {
        return storeUnlockKeys({key});
    }
    std::optional<service::Refusal> storeUnlockKeys(
        const std::vector<service::UnlockKey>& keys) override {
        if (_broken) return _broken;
        for (const auto& key : keys)
            if (!isThere(key.account, key.hash))
                return service::Refusal{service::status::kNotPaired, "They are not paired."};
        for (const auto& key : keys) {
            removeUnlockKey(key.account, key.hash);
            _unlockKeys.push_back(key);
        }
        return std::nullopt;
    }
    service::Outcome<std::optional<service::UnlockKey>> unlockKey(
        const std::string& account, const platform::Bytes& hash) override {
        if (_broken) return *_broken;
        for (const auto& key : _unlockKeys)
            if (key.account == account && key.hash == hash) return std::optional(key);
        return std::optional<service::UnlockKey>();
    }
    service::Outcome<std::vector<service::UnlockKey>> unlockKeysOf(
        const std::string& account) override {
        if (_broken) return *_broken;
        std::vector<service::UnlockKey> found;
        std::ranges::copy_if(_unlockKeys, std::back_inserter(found),
                             [&](const auto& key) { return key.account == account; });
        std::ranges::sort(found, {}, &service::UnlockKey::hash);
        return found;
    }
    service::Outcome<bool> eraseUnlockKey(const std::string& account,
                                          const platform::Bytes& hash) override {
        if (_broken) return *_broken;
        return removeUnlockKey(account, hash);
    }

private:
    bool removePairing(const std::string& account, const platform::Bytes& hash) {
        return std::erase_if(_pairings, [&](const auto& pairing) {
                   return pairing.account == account && pairing.hash == hash;
               }) > 0;
    }

    bool removeUnlockKey(const std::string& account, const platform::Bytes& hash) {
        return std::erase_if(_unlockKeys, [&](const auto& key) {
                   return key.account == account && key.hash == hash;
               }) > 0;
    }
    bool isThere(const std::string& account, const platform::Bytes& hash) const {
        return std::ranges::any_of(_pairings, [&](const auto& pairing) {
            return pairing.account == account && pairing.hash == hash;
        });
    }

    service::Outcome<std::vector<service::Pairing>> latestFirst(
        const std::function<bool(const service::Pairing&)>& matches) {
        if (_broken) return *_broken;
        std::vector<service::Pairing> found;
        std::ranges::copy_if(_pairings, std::back_inserter(found), matches);
        std::ranges::reverse(found);
        return found;
    }

    std::vector<service::Pairing> _pairings;
    std::vector<service::UnlockKey> _unlockKeys;
    std::int64_t _last = 0;
    std::optional<service::Refusal> _broken;
};

}  // namespace vlm::fakes
