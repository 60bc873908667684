// What platform/accounts.h promises. Verbs: add(name, id).

#pragma once

#include "platform/accounts.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class AccountsContract : public ContractTest<Backend> {};

TYPED_TEST_SUITE_P(AccountsContract);

TYPED_TEST_P(AccountsContract, FindsAnAccountByItsName) {
    this->backend().add("alice", 1000);
    this->backend().add("bob", 1001);

    EXPECT_EQ(this->backend().get().userId("alice"), 1000U);
    EXPECT_EQ(this->backend().get().userId("bob"), 1001U);
}

TYPED_TEST_P(AccountsContract, FindsAnAccountByItsId) {
    this->backend().add("alice", 1000);
    this->backend().add("bob", 1001);

    EXPECT_EQ(this->backend().get().userName(1000), "alice");
    EXPECT_EQ(this->backend().get().userName(1001), "bob");
}

TYPED_TEST_P(AccountsContract, FindsTheSuperuserWithTheIdZero) {
    this->backend().add("root", 0);

    EXPECT_EQ(this->backend().get().userId("root"), 0U);
    EXPECT_EQ(this->backend().get().userName(0), "root");
}

TYPED_TEST_P(AccountsContract, DoesNotKnowWhoWasNotAdded) {
    this->backend().add("alice", 1000);

    EXPECT_EQ(this->backend().get().userId("bob"), std::nullopt);
    EXPECT_EQ(this->backend().get().userId("alic"), std::nullopt);
    EXPECT_EQ(this->backend().get().userId("alicee"), std::nullopt);
    EXPECT_EQ(this->backend().get().userId("Alice"), std::nullopt);
    EXPECT_EQ(this->backend().get().userId(""), std::nullopt);
    EXPECT_EQ(this->backend().get().userName(1001), std::nullopt);
    EXPECT_EQ(this->backend().get().userName(platform::kNobody), std::nullopt);
}

TYPED_TEST_P(AccountsContract, TakesNamesAsUtf8) {
    this->backend().add("j\xC3\xB6rg", 1002);

    EXPECT_EQ(this->backend().get().userId("j\xC3\xB6rg"), 1002U);
    EXPECT_EQ(this->backend().get().userName(1002), "j\xC3\xB6rg");
}

TYPED_TEST_P(AccountsContract, HoldsIdsAboveTheSignedRange) {
    this->backend().add("directory", 4294967294U);

    EXPECT_EQ(this->backend().get().userId("directory"), 4294967294U);
    EXPECT_EQ(this->backend().get().userName(4294967294U), "directory");
}

TYPED_TEST_P(AccountsContract, GivesNoNameForAnEntryWithoutOne) {
    this->backend().add("", 1003);

    EXPECT_EQ(this->backend().get().userName(1003), std::nullopt);
}

REGISTER_TYPED_TEST_SUITE_P(AccountsContract, FindsAnAccountByItsName, FindsAnAccountByItsId,
                            FindsTheSuperuserWithTheIdZero, DoesNotKnowWhoWasNotAdded,
                            TakesNamesAsUtf8, HoldsIdsAboveTheSignedRange,
                            GivesNoNameForAnEntryWithoutOne);

}  // namespace vlm::contracts
