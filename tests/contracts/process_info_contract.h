// What platform/process_info.h promises. Verbs: runAs(user, name), with an empty name for a user
// without an account; runSetUserId(real, effective), both without accounts.

#pragma once

#include "platform/process_info.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class ProcessInfoContract : public ContractTest<Backend> {};

TYPED_TEST_SUITE_P(ProcessInfoContract);

TYPED_TEST_P(ProcessInfoContract, RunsAsTheUserWhoStartedIt) {
    this->backend().runAs(54321, "alice");

    EXPECT_EQ(this->backend().get().realUserId(), 54321U);
    EXPECT_EQ(this->backend().get().effectiveUserId(), 54321U);
    EXPECT_EQ(this->backend().get().ownerUserName(), "alice");
}

TYPED_TEST_P(ProcessInfoContract, NamesAnOwnerWithoutAnAccountByItsId) {
    this->backend().runAs(54322, "");

    EXPECT_EQ(this->backend().get().ownerUserName(), "54322");
}

TYPED_TEST_P(ProcessInfoContract, BelongsToItsEffectiveUserWhenItIsSetUserId) {
    this->backend().runSetUserId(54323, 54324);

    EXPECT_EQ(this->backend().get().realUserId(), 54323U);
    EXPECT_EQ(this->backend().get().effectiveUserId(), 54324U);
    EXPECT_EQ(this->backend().get().ownerUserName(), "54324");
}

REGISTER_TYPED_TEST_SUITE_P(ProcessInfoContract, RunsAsTheUserWhoStartedIt,
                            NamesAnOwnerWithoutAnAccountByItsId,
                            BelongsToItsEffectiveUserWhenItIsSetUserId);

}  // namespace vlm::contracts
