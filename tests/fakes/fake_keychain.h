#pragma once

#include <vector>

#include "platform/keychain.h"

namespace vlm::fakes {

class FakeKeychain final : public platform::Keychain {
public:
    // What a test does to the world.
    void failWith(platform::Status status) { _status = status; }

    platform::Status eraseUnlockKey(const platform::Bytes& publicKeyHash) override {
        erased.push_back(publicKeyHash);
        return _status;
    }

    std::vector<platform::Bytes> erased;

private:
    platform::Status _status = platform::kSuccess;
};

}  // namespace vlm::fakes
