#include <gmock/gmock.h>

#include <cstdlib>
#include <functional>
#include <future>
#include <memory>
#include <optional>

#include "fake_authorization.h"
#include "platform/linux/polkit_authorization.h"
#include "tests/contracts/authorization_contract.h"
#include "tests/integration/linux/fake_authority.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/probe.h"

namespace vlm::test {

namespace {

using namespace std::chrono_literals;
using Answer = FakeAuthority::Answer;
using platform::AuthorizationFlags;
using platform::Status;
using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;

constexpr AuthorizationFlags kAsking{.interactionAllowed = true, .extendRights = true};
constexpr const char* kRight = "org.example.one";

class FakeAuthorizationBackend : public contracts::FakeBackend<fakes::FakeAuthorization> {
public:
    void allow() { get().allow(); }
    void deny() { get().deny(); }
    void dismiss() { get().dismiss(); }
    void leave() { get().leave(); }
    void keep(const std::string& right) { get().keep(right); }
    void fail() { get().answerWith(platform::kAuthorizationFailed); }
    void cutOff() { get().refuseSessions(platform::kAuthorizationFailed); }
    std::vector<std::string> asked() { return get().asked; }
};

// The real class, a real bus, and an authority on it.
class PolkitBackend {
public:
    PolkitBackend() { ::setenv("DBUS_SYSTEM_BUS_ADDRESS", _bus.address().c_str(), 1); }
    ~PolkitBackend() { ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS"); }
    PolkitBackend(const PolkitBackend&) = delete;
    PolkitBackend& operator=(const PolkitBackend&) = delete;

    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::PolkitAuthorization& get() { return _authorization; }
    void allow() { authority->answer(Answer::Allowed); }
    void deny() { authority->answer(Answer::Denied); }
    void dismiss() { authority->answer(Answer::Dismissed); }
    void leave() { authority->answer(Answer::Challenge); }
    void keep(const std::string& right) { authority->keep(right); }
    void fail() { authority->answer(Answer::Error); }
    void cutOff() { _bus.stop(); }
    std::vector<std::string> asked() { return authority->asked(); }

    void restart() {
        authority.reset();
        authority = std::make_unique<FakeAuthority>(_bus.address());
    }
    bool isOnBus(const std::string& name) { return _bus.hasOwner(name); }

private:
    PrivateBus _bus;
    platform::PolkitAuthorization _authorization;

public:
    std::unique_ptr<FakeAuthority> authority = std::make_unique<FakeAuthority>(_bus.address());
};

class PolkitAuthorizationTest : public contracts::ContractTest<PolkitBackend> {
protected:
    FakeAuthority& authority() { return *backend().authority; }

    Status request() { return backend().get().createSession().session->request(kRight, kAsking); }

    // Of a person who does not answer. What happens meanwhile is the test's.
    Status requestWhile(const std::function<void()>& happens) {
        authority().answer(Answer::Never);
        auto status = std::async(std::launch::async, [this] { return request(); });
        EXPECT_TRUE(authority().isAsked());
        happens();
        return status.get();
    }
};

TEST_F(PolkitAuthorizationTest, AsksAboutItsOwnConnection) {
    request();
    request();

    const auto questions = authority().questions();
    ASSERT_EQ(questions.size(), 2U);
    for (const auto& question : questions) {
        EXPECT_EQ(question.subjectKind, "system-bus-name name");
        EXPECT_EQ(question.subjectName, question.sender);
        EXPECT_EQ(question.action, kRight);
        EXPECT_EQ(question.flags, 1U);
        EXPECT_EQ(question.cancellation, "");
    }
    EXPECT_NE(questions[0].sender, questions[1].sender);
}

TEST_F(PolkitAuthorizationTest, EndsWhenTheAuthorityEnds) {
    EXPECT_EQ(requestWhile([this] { backend().authority.reset(); }),
              platform::kAuthorizationFailed);
}

TEST_F(PolkitAuthorizationTest, EndsWhenTheBusEnds) {
    EXPECT_EQ(requestWhile([this] { backend().cutOff(); }), platform::kAuthorizationFailed);
}

TEST_F(PolkitAuthorizationTest, IsThereForTheNextRequestAfterTheAuthorityCameBack) {
    const auto created = backend().get().createSession();
    authority().answer(Answer::Error);
    EXPECT_EQ(created.session->request(kRight, kAsking), platform::kAuthorizationFailed);
    backend().restart();

    EXPECT_EQ(created.session->request(kRight, kAsking), platform::kSuccess);
}

TEST_F(PolkitAuthorizationTest, BelievesNoAnswerThatItCannotRead) {
    authority().answer(Answer::Unreadable);

    EXPECT_EQ(request(), platform::kAuthorizationFailed);
}

TEST_F(PolkitAuthorizationTest, WaitsForAPersonAsLongAsItIsToldTo) {
    authority().answer(Answer::Never);
    platform::PolkitAuthorization impatient(50ms);

    EXPECT_EQ(impatient.createSession().session->request(kRight, kAsking),
              platform::kAuthorizationFailed);

    // The bus library's own patience is shorter than that of people.
    EXPECT_GE(platform::PolkitAuthorization::kPatience, 5min);
}

TEST_F(PolkitAuthorizationTest, LeavesTheBusWithTheSession) {
    auto created = backend().get().createSession();
    created.session->request(kRight, kAsking);
    const std::string name = authority().questions().at(0).sender;
    ASSERT_TRUE(backend().isOnBus(name));

    created.session.reset();

    EXPECT_TRUE(eventually([&] { return !backend().isOnBus(name); }));
}

// A process that asks on this bus for the right, and what it logs.
Ended asking(const std::string& address) {
    return run(probe({"authorize", kRight}),
               {.environment = {{"DBUS_SYSTEM_BUS_ADDRESS", address}, {"VLM_LOG_TARGET", "stderr"}},
                .user = {}});
}

TEST(PolkitAuthorizationLogTest, SaysWhyThereIsNoAnswer) {
    const PrivateBus bus;

    const auto withoutAuthority = asking(bus.address());
    EXPECT_EQ(withoutAuthority.output, "-60008");
    EXPECT_THAT(
        withoutAuthority.errors,
        AllOf(StartsWith("error vlmbind: The right org.example.one was not asked for. The "
                         "service org.freedesktop.PolicyKit1 on the system bus is not there"),
              HasSubstr("Check that it is installed.")));

    const auto withoutBus = asking("unix:path=/nowhere");
    EXPECT_EQ(withoutBus.output, "-60008");
    EXPECT_THAT(withoutBus.errors, StartsWith("error vlmbind: No rights can be asked for. "));
}

TEST(PolkitAuthorizationLogTest, SaysNothingOfAPersonsDecision) {
    const PrivateBus bus;
    FakeAuthority authority(bus.address());
    for (const auto answer : {Answer::Allowed, Answer::Denied, Answer::Dismissed}) {
        authority.answer(answer);

        EXPECT_EQ(asking(bus.address()).errors, "");
    }
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, AuthorizationContract, test::FakeAuthorizationBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Polkit, AuthorizationContract, test::PolkitBackend);
}  // namespace vlm::contracts
