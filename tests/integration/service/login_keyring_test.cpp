// The login keyring on a real bus and a real socket, with a provider in the test's hands.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "bus_test.h"
#include "fake_keyring_provider.h"
#include "services/keychain/keyring_control.h"
#include "services/keychain/secret_service_keyring.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {
namespace {

constexpr const char* kLogin = "/org/freedesktop/secrets/collection/login";

class LoginKeyringTest : public BusTest {
protected:
    FakeKeyringProvider& provide(const FakeKeyringProvider::Nature& nature) {
        provider.emplace(connect(), nature);
        return *provider;
    }
    std::optional<FoundKeyring> find() {
        found.reset();
        work = keyring.find([this](std::optional<FoundKeyring> answer) { found.emplace(answer); });
        EXPECT_FALSE(found) << "never before find() has returned";
        runUntil([this] { return found.has_value(); });
        return *found;
    }
    void begin(const std::string& password) {
        verdict.reset();
        work = keyring.tryPassword(Secret(password), [this](KeyringVerdict given) {
            EXPECT_FALSE(verdict) << "it is answered once";
            verdict = given;
        });
        EXPECT_FALSE(verdict);
    }
    KeyringVerdict tryPassword(const std::string& password) {
        begin(password);
        runUntil([this] { return verdict.has_value(); });
        return *verdict;
    }
    void listen(FakeKeyringProvider::Answer answer) {
        provide({}).listen(event(), folder.path(), std::move(answer));
    }

    test::TemporaryFolder folder;
    platform::SdBus own = connect();
    std::optional<FakeKeyringProvider> provider;
    SecretServiceKeyring keyring{event(), own.get(), folder.path()};
    std::optional<std::optional<FoundKeyring>> found;
    std::optional<KeyringVerdict> verdict;
    std::unique_ptr<LoginKeyring::Work> work;
};

TEST_F(LoginKeyringTest, IsTheCollectionWithTheAlias) {
    provide({.alias = "/org/example/kept", .collection = "/org/example/kept"});

    EXPECT_EQ(find(), (FoundKeyring{"/org/example/kept", true}));
}

TEST_F(LoginKeyringTest, IsTheCollectionOfThatNameWithoutTheAlias) {
    provide({.alias = "/"});

    EXPECT_EQ(find(), (FoundKeyring{kLogin, true}));
}

TEST_F(LoginKeyringTest, ChecksNoPasswordsWithAnotherProvider) {
    provide({.isGnomeKeyring = false});

    EXPECT_EQ(find(), (FoundKeyring{kLogin, false}));
}

TEST_F(LoginKeyringTest, ChecksNoPasswordsWhenTheKeyringIsAnothersThanGnomeKeyring) {
    provide({.isGnomeKeyring = false});
    const auto beside = connect();
    ASSERT_GE(sd_bus_request_name(beside.get(), "org.gnome.keyring", 0), 0);

    EXPECT_EQ(find(), (FoundKeyring{kLogin, false}));
}

TEST_F(LoginKeyringTest, IsNoneWithoutAProvider) { EXPECT_EQ(find(), std::nullopt); }

TEST_F(LoginKeyringTest, IsNoneWithoutTheCollection) {
    provide({.alias = "/", .collection = ""});

    EXPECT_EQ(find(), std::nullopt);
}

TEST_F(LoginKeyringTest, IsNoneWhenTheProviderLeavesMeanwhile) {
    provide({.answers = false});
    work = keyring.find([this](std::optional<FoundKeyring> answer) { found.emplace(answer); });
    runUntilQuiet();
    ASSERT_FALSE(found);

    provider.reset();
    runUntil([this] { return found.has_value(); });

    EXPECT_EQ(*found, std::nullopt);
}

TEST_F(LoginKeyringTest, IsNoneWhenTheProviderDoesNotAnswer) {
    provide({.answers = false});

    EXPECT_EQ(find(), std::nullopt);
}

TEST_F(LoginKeyringTest, AnswersNobodyWhoHasGivenUp) {
    provide({});
    work = keyring.find([this](std::optional<FoundKeyring> answer) { found.emplace(answer); });

    work.reset();
    runUntilQuiet();

    EXPECT_FALSE(found);
}

TEST_F(LoginKeyringTest, IsOpenedByItsPasswordAndByNoOther) {
    listen(FakeKeyringProvider::openedBy("open sesame"));

    EXPECT_EQ(tryPassword("wrong"), KeyringVerdict::Refused);
    EXPECT_EQ(tryPassword("open sesame"), KeyringVerdict::Opened);
}

TEST_F(LoginKeyringTest, TakesPasswordsOfAnyBytesAndOfAnyLengthThatIsAllowed) {
    const std::string odd("a\0\n\xFF", 4);
    for (const auto& password : {odd, std::string(1024, 'x'), std::string("p")}) {
        listen(FakeKeyringProvider::openedBy(password));

        EXPECT_EQ(tryPassword(password), KeyringVerdict::Opened);
        std::filesystem::remove(folder.path() / "keyring/control");
        provider.reset();
    }
}

TEST_F(LoginKeyringTest, FailsWithoutASocket) {
    EXPECT_EQ(tryPassword("open sesame"), KeyringVerdict::Failed);
    EXPECT_FALSE(log().lines().empty());
    for (const auto& line : log().lines())
        EXPECT_THAT(line.text, Not(testing::HasSubstr("sesame")));
}

TEST_F(LoginKeyringTest, FailsWhenTheAnswerCannotBeUnderstood) {
    for (const auto& [why, answer] :
         {std::pair("a failure", FakeKeyringProvider::result(2)),
          std::pair("another result", FakeKeyringProvider::result(0xFFFFFFFF)),
          std::pair("another length", std::string(8, '\x7F'))}) {
        listen([answer = answer](const std::string&) { return answer; });

        EXPECT_EQ(tryPassword("x"), KeyringVerdict::Failed) << why;
        std::filesystem::remove(folder.path() / "keyring/control");
        provider.reset();
    }
}

TEST_F(LoginKeyringTest, FailsWhenTheOtherSideHangsUp) {
    listen([](const std::string&) { return ""; });
    begin("x");
    runUntil([this] { return !provider->requests.empty(); });

    provider.reset();
    runUntil([this] { return verdict.has_value(); });

    EXPECT_EQ(verdict, KeyringVerdict::Failed);
}

TEST_F(LoginKeyringTest, PutsAnAnswerInTwoPiecesTogether) {
    listen([](const std::string&) { return FakeKeyringProvider::result(0).substr(0, 5); });
    begin("x");
    runUntil([this] { return !provider->requests.empty(); });
    runUntilQuiet();

    EXPECT_FALSE(verdict) << "five bytes are no answer";
}

TEST_F(LoginKeyringTest, HangsUpWhenItIsGivenUp) {
    listen([](const std::string&) { return ""; });
    begin("x");
    runUntil([this] { return !provider->requests.empty(); });

    work.reset();
    runUntilQuiet();

    EXPECT_FALSE(verdict);
}

TEST_F(LoginKeyringTest, CostsATimeLimitWhenNobodyAnswers) {
    listen([](const std::string&) { return ""; });
    begin("x");

    runUntil([this] { return !provider->requests.empty(); });
    // The limit is the loop's next event, and runUntil() waits as long as that for it.
    while (!verdict) ASSERT_GT(sd_event_run(event(), 15'000'000), 0);

    EXPECT_EQ(verdict, KeyringVerdict::Failed);
}

TEST_F(LoginKeyringTest, GivesNoPasswordToAPathThatIsTooLongForASocket) {
    SecretServiceKeyring faraway(event(), own.get(), std::string(200, 'x'));
    work = faraway.tryPassword(Secret("x"), [this](KeyringVerdict given) { verdict = given; });
    runUntil([this] { return verdict.has_value(); });

    EXPECT_EQ(verdict, KeyringVerdict::Failed);
}

}  // namespace
}  // namespace vlm::service
