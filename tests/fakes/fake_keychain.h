#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "platform/keychain.h"

namespace vlm::fakes {

// One login keyring, and the unlock keys that were stored for it.
class FakeKeychain final : public platform::Keychain {
public:
    struct Stored {
        platform::Bytes hash;
        std::string token;
        platform::Bytes wrapKeyHash;
        std::string keychain;
        std::string text;
        bool operator==(const Stored&) const = default;
    };

    // What a test does to the world.
    void failWith(platform::Status status) { _status = status; }
    void failToCopyWith(platform::Status status) { _copyStatus = status; }

    // What happened.
    std::vector<platform::Bytes> erased;  // asked for
    std::vector<Stored> asked;            // to store
    std::vector<Stored> stored;           // what is there now
    int copies = 0;                       // asked for
    int held() const { return *_held; }   // copies that are not released yet

    Copied copyLoginKeychain() override {
        ++copies;
        if (_copyStatus != platform::kSuccess) return {_copyStatus, nullptr};
        return {platform::kSuccess, std::make_unique<FakeLoginKeychain>(_held)};
    }
    platform::Status storeUnlockKey(const platform::Bytes& publicKeyHash, const std::string& token,
                                    const platform::Bytes& wrapKeyHash,
                                    const platform::LoginKeychain& keychain,
                                    const std::string& text) override {
        asked.push_back({publicKeyHash, token, wrapKeyHash, keychain.name(), text});
        if (_status != platform::kSuccess) return _status;
        remove(publicKeyHash);
        stored.push_back(asked.back());
        return platform::kSuccess;
    }
    platform::Status eraseUnlockKey(const platform::Bytes& publicKeyHash) override {
        erased.push_back(publicKeyHash);
        if (_status == platform::kSuccess) remove(publicKeyHash);
        return _status;
    }

private:
    class FakeLoginKeychain final : public platform::LoginKeychain {
    public:
        explicit FakeLoginKeychain(std::shared_ptr<int> held) : _held(std::move(held)) { ++*_held; }
        FakeLoginKeychain(const FakeLoginKeychain&) = delete;
        FakeLoginKeychain& operator=(const FakeLoginKeychain&) = delete;
        ~FakeLoginKeychain() override { --*_held; }
        const std::string& name() const override { return _name; }

    private:
        const std::string _name = "/keyring/login";
        std::shared_ptr<int> _held;
    };

    void remove(const platform::Bytes& hash) {
        std::erase_if(stored, [&](const Stored& each) { return each.hash == hash; });
    }

    platform::Status _status = platform::kSuccess;
    platform::Status _copyStatus = platform::kSuccess;
    std::shared_ptr<int> _held = std::make_shared<int>(0);
};

}  // namespace vlm::fakes
