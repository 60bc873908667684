// What platform/authorization.h promises.
//
// Verbs: allow(), deny(), dismiss(): what the person answers; leave(): there is nobody to be asked;
// keep(right): it was granted before; cutOff(): there is no way to the service; fail(): the
// service answers nothing that means anything. asked(): the rights that a person was asked for.

#pragma once

#include <string>
#include <vector>

#include "platform/authorization.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class AuthorizationContract : public ContractTest<Backend> {
protected:
    static constexpr platform::AuthorizationFlags kAsking{.interactionAllowed = true,
                                                          .extendRights = true};

    // Of a session of its own.
    platform::Status request(const std::string& right = "org.example.one",
                             platform::AuthorizationFlags flags = kAsking) {
        const auto created = this->backend().get().createSession();
        EXPECT_EQ(created.status, platform::kSuccess);
        return created.session ? created.session->request(right, flags) : created.status;
    }
};

TYPED_TEST_SUITE_P(AuthorizationContract);

TYPED_TEST_P(AuthorizationContract, GrantsWhatThePersonAllows) {
    this->backend().allow();

    EXPECT_EQ(this->request("org.example.one"), platform::kSuccess);

    EXPECT_EQ(this->backend().asked(), std::vector<std::string>{"org.example.one"});
}

TYPED_TEST_P(AuthorizationContract, TellsADismissalFromADenial) {
    this->backend().dismiss();
    EXPECT_EQ(this->request(), platform::kAuthorizationCanceled);

    this->backend().deny();
    EXPECT_EQ(this->request(), platform::kAuthorizationDenied);
}

TYPED_TEST_P(AuthorizationContract, SaysThatNobodyCanBeAsked) {
    this->backend().leave();

    EXPECT_EQ(this->request(), platform::kInteractionNotAllowed);
    EXPECT_TRUE(this->backend().asked().empty());
}

TYPED_TEST_P(AuthorizationContract, AsksNobodyWithoutBothFlags) {
    this->backend().allow();

    EXPECT_EQ(this->request("org.example.one", {}), platform::kInteractionNotAllowed);
    EXPECT_EQ(this->request("org.example.one", {.interactionAllowed = true}),
              platform::kInteractionNotAllowed);
    EXPECT_EQ(this->request("org.example.one", {.extendRights = true}),
              platform::kInteractionNotAllowed);

    EXPECT_TRUE(this->backend().asked().empty());
}

TYPED_TEST_P(AuthorizationContract, GrantsWhatIsKeptWithoutAQuestion) {
    this->backend().deny();
    this->backend().keep("org.example.one");

    EXPECT_EQ(this->request("org.example.one"), platform::kSuccess);
    EXPECT_EQ(this->request("org.example.one", {}), platform::kSuccess);
    EXPECT_EQ(this->request("org.example.two"), platform::kAuthorizationDenied);

    EXPECT_EQ(this->backend().asked(), std::vector<std::string>{"org.example.two"});
}

TYPED_TEST_P(AuthorizationContract, TakesSeveralRequestsInOneSession) {
    const auto created = this->backend().get().createSession();
    ASSERT_TRUE(created.session);
    this->backend().deny();
    EXPECT_EQ(created.session->request("org.example.one", this->kAsking),
              platform::kAuthorizationDenied);
    this->backend().allow();

    EXPECT_EQ(created.session->request("org.example.two", this->kAsking), platform::kSuccess);
}

TYPED_TEST_P(AuthorizationContract, SaysThatTheServiceGaveNoAnswer) {
    this->backend().fail();

    EXPECT_EQ(this->request(), platform::kAuthorizationFailed);
}

TYPED_TEST_P(AuthorizationContract, MakesNoSessionWithoutAWayToTheService) {
    this->backend().cutOff();

    const auto created = this->backend().get().createSession();

    EXPECT_EQ(created.status, platform::kAuthorizationFailed);
    EXPECT_EQ(created.session, nullptr);
}

REGISTER_TYPED_TEST_SUITE_P(AuthorizationContract, GrantsWhatThePersonAllows,
                            TellsADismissalFromADenial, SaysThatNobodyCanBeAsked,
                            AsksNobodyWithoutBothFlags, GrantsWhatIsKeptWithoutAQuestion,
                            TakesSeveralRequestsInOneSession, SaysThatTheServiceGaveNoAnswer,
                            MakesNoSessionWithoutAWayToTheService);

}  // namespace vlm::contracts
