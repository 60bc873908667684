// What platform/keychain.h promises. Verbs: failToCopyWith(status), failWith(status), the unlock
// keys that are stored(), and how many copies are held().

#pragma once

#include <string>
#include <vector>

#include "platform/keychain.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class KeychainContract : public ContractTest<Backend> {
protected:
    const platform::Bytes hash = platform::Bytes(32, 0xAB);
    const platform::Bytes wrapKeyHash = platform::Bytes(32, 0xCD);

    platform::Status store(const std::string& token) {
        auto& keychain = this->backend().get();
        const auto copied = keychain.copyLoginKeychain();
        EXPECT_EQ(copied.status, platform::kSuccess);
        if (!copied.keychain) return copied.status;
        return keychain.storeUnlockKey(hash, token, wrapKeyHash, *copied.keychain, "");
    }
};

TYPED_TEST_SUITE_P(KeychainContract);

TYPED_TEST_P(KeychainContract, CopiesALoginKeyringThatHasAName) {
    const auto copied = this->backend().get().copyLoginKeychain();

    EXPECT_EQ(copied.status, platform::kSuccess);
    ASSERT_TRUE(copied.keychain);
    EXPECT_FALSE(copied.keychain->name().empty());
}

TYPED_TEST_P(KeychainContract, HasNoKeyringBesideAFailureToCopyIt) {
    this->backend().failToCopyWith(-2021);

    const auto copied = this->backend().get().copyLoginKeychain();

    EXPECT_EQ(copied.status, -2021);
    EXPECT_FALSE(copied.keychain);
}

TYPED_TEST_P(KeychainContract, StoresAnUnlockKeyOnceForEachKey) {
    EXPECT_EQ(this->store("pkcs11:token=a"), platform::kSuccess);
    EXPECT_EQ(this->store("pkcs11:token=b"), platform::kSuccess);

    EXPECT_EQ(this->backend().stored(), (std::vector<std::string>{"pkcs11:token=b"}));
}

TYPED_TEST_P(KeychainContract, ErasesAnUnlockKeyAndIsContentWhenThereIsNone) {
    EXPECT_EQ(this->store("pkcs11:token=a"), platform::kSuccess);

    EXPECT_EQ(this->backend().get().eraseUnlockKey(this->hash), platform::kSuccess);
    EXPECT_TRUE(this->backend().stored().empty());
    EXPECT_EQ(this->backend().get().eraseUnlockKey(this->hash), platform::kSuccess);
}

TYPED_TEST_P(KeychainContract, PassesTheStatusesOfTheServiceOn) {
    this->backend().failWith(-2022);

    EXPECT_EQ(this->store("pkcs11:token=a"), -2022);
    EXPECT_EQ(this->backend().get().eraseUnlockKey(this->hash), -2022);
    EXPECT_TRUE(this->backend().stored().empty());
}

REGISTER_TYPED_TEST_SUITE_P(KeychainContract, CopiesALoginKeyringThatHasAName,
                            HasNoKeyringBesideAFailureToCopyIt, StoresAnUnlockKeyOnceForEachKey,
                            ErasesAnUnlockKeyAndIsContentWhenThereIsNone,
                            PassesTheStatusesOfTheServiceOn);

}  // namespace vlm::contracts
