#include <gtest/gtest.h>

#include "platform/linux/absent_keychain.h"

namespace vlm::test {

TEST(AbsentKeychainTest, SaysByItsStatusThatThereIsNoKeychainService) {
    platform::AbsentKeychain keychain;

    EXPECT_EQ(keychain.eraseUnlockKey(platform::Bytes(32, 0xAB)), -3000);
    EXPECT_EQ(keychain.eraseUnlockKey({}), -3000);
}

}  // namespace vlm::test
