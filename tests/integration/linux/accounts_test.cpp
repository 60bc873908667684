#include "fake_accounts.h"
#include "platform/linux/nss_accounts.h"
#include "tests/contracts/accounts_contract.h"
#include "tests/integration/linux/changed_machine.h"
#include "tests/integration/linux/probe.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

class FakeAccountsBackend : public contracts::FakeBackend<fakes::FakeAccounts> {
public:
    void add(const std::string& name, platform::UserId id) { get().add(name, id); }
};

// The real class in a process whose /etc/passwd is the test's.
class NssAccountsBackend final : public platform::Accounts {
public:
    std::optional<std::string> unavailable() { return ChangedMachine::unavailable(); }
    platform::Accounts& get() { return *this; }

    void add(const std::string& name, platform::UserId id, const std::string& comment = "") {
        _entries += name + ":x:" + std::to_string(id) + ":100:" + comment + ":/:/bin/sh\n";
        _machine.replace("/etc/passwd", _folder.write("passwd", _entries));
    }

    std::optional<platform::UserId> userId(const std::string& userName) const override {
        const auto answer = ask({"user-id", userName});
        if (!answer) return std::nullopt;
        return static_cast<platform::UserId>(std::stoul(*answer));
    }

    std::optional<std::string> userName(platform::UserId userId) const override {
        return ask({"user-name", std::to_string(userId)});
    }

private:
    std::optional<std::string> ask(const std::vector<std::string>& question) const {
        const auto ended = _machine.run(probe(question));
        if (ended.status == kProbeAnswersNone) return std::nullopt;
        EXPECT_EQ(ended.status, 0) << ended.errors;
        return ended.output;
    }

    TemporaryFolder _folder;
    std::string _entries;
    ChangedMachine _machine;
};

class NssAccountsTest : public contracts::ContractTest<NssAccountsBackend> {};

TEST_F(NssAccountsTest, ReadsAnEntryThatIsLargerThanUsual) {
    backend().add("alice", 1000, std::string(100'000, 'x'));

    EXPECT_EQ(backend().get().userId("alice"), 1000U);
    EXPECT_EQ(backend().get().userName(1000), "alice");
}

TEST_F(NssAccountsTest, TakesTheIdThatMeansNobodyForNoAccount) {
    backend().add("nobody-at-all", platform::kNobody);

    EXPECT_EQ(backend().get().userId("nobody-at-all"), std::nullopt);
}

TEST(NssAccountsHereTest, DoesNotTakeANameWithAZeroForThePartBeforeIt) {
    const platform::NssAccounts accounts;
    const auto superuser = accounts.userName(0);
    ASSERT_TRUE(superuser);

    EXPECT_EQ(accounts.userId(*superuser), 0U);
    EXPECT_EQ(accounts.userId(*superuser + std::string("\0x", 2)), std::nullopt);
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, AccountsContract, test::FakeAccountsBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Nss, AccountsContract, test::NssAccountsBackend);
}  // namespace vlm::contracts
