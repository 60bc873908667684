#include "fake_unlock_key.h"

#include "bind/bind_operation.h"

namespace vlm {

fakes::FakeUnlockKey& fakes::unlockKey() {
    static FakeUnlockKey unlockKey;
    return unlockKey;
}

platform::Status BindOperation::storeUnlockKey(const OptionalHash& publicKeyHash,
                                               ErrorPlace error) {
    auto& fake = fakes::unlockKey();
    fake.asked.push_back(publicKeyHash);
    if (error && fake.error) *error = fake.error;
    return fake.status;
}

}  // namespace vlm
