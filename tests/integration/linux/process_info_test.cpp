#include <unistd.h>

#include <sstream>

#include "fake_process_info.h"
#include "platform/linux/posix_process_info.h"
#include "tests/contracts/process_info_contract.h"
#include "tests/integration/linux/changed_machine.h"
#include "tests/integration/linux/probe.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

namespace {

class FakeProcessBackend : public contracts::FakeBackend<fakes::FakeProcessInfo> {
public:
    void runAs(platform::UserId user, const std::string& name) { get().runAs(user, name); }
    void runSetUserId(platform::UserId real, platform::UserId effective) {
        get().runSetUserId(real, effective);
    }
};

// What the real class says in a process that changed its user.
class PosixProcessBackend final : public platform::ProcessInfo {
public:
    std::optional<std::string> unavailable() {
        if (::geteuid() != 0) return "only the superuser can run a process as somebody else";
        return ChangedMachine::unavailable();
    }
    platform::ProcessInfo& get() { return *this; }

    void runAs(platform::UserId user, const std::string& name) {
        run(user, user, name.empty() ? "" : name + ":x:" + std::to_string(user) + ":0::/:\n");
    }
    void runSetUserId(platform::UserId real, platform::UserId effective) {
        run(real, effective, "");
    }

    platform::UserId realUserId() const override { return _real; }
    platform::UserId effectiveUserId() const override { return _effective; }
    std::string ownerUserName() const override { return _owner; }

private:
    void run(platform::UserId real, platform::UserId effective, const std::string& entries) {
        ChangedMachine machine;
        machine.replace("/etc/passwd", _folder.write("passwd", entries));
        const auto ended =
            machine.run(probe({"process", std::to_string(real), std::to_string(effective)}));
        EXPECT_EQ(ended.status, 0) << ended.errors;
        std::istringstream(ended.output) >> _real >> _effective >> _owner;
    }

    TemporaryFolder _folder;
    platform::UserId _real = 0;
    platform::UserId _effective = 0;
    std::string _owner;
};

TEST(PosixProcessInfoTest, IsAboutThisVeryProcess) {
    const platform::PosixProcessInfo info;

    EXPECT_EQ(info.realUserId(), ::getuid());
    EXPECT_EQ(info.effectiveUserId(), ::geteuid());
    EXPECT_EQ(info.ownerUserName() + "\n", run({"sh", "-c", "id -un 2>&- || id -u"}).output);
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, ProcessInfoContract, test::FakeProcessBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Posix, ProcessInfoContract, test::PosixProcessBackend);
}  // namespace vlm::contracts
