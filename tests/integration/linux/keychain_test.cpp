#include <unistd.h>

#include <cstdlib>
#include <map>
#include <memory>
#include <mutex>
#include <optional>

#include "fake_keychain.h"
#include "platform/accounts.h"
#include "platform/linux/service_keychain.h"
#include "platform/platform.h"
#include "tests/contracts/keychain_contract.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::test {

namespace {

using platform::Bytes;
using platform::Message;
using platform::Status;

constexpr const char* kDaemon = "org.vlm.token.hints.daemon";

class FakeKeychainBackend : public contracts::FakeBackend<fakes::FakeKeychain> {
public:
    void failToCopyWith(Status status) { get().failToCopyWith(status); }
    void failWith(Status status) { get().failWith(status); }
    std::vector<std::string> stored() {
        std::vector<std::string> tokens;
        for (const auto& each : get().stored) tokens.push_back(each.token);
        return tokens;
    }
};

// What of the hints service a keychain asks: one user's keyring and unlock keys.
class DaemonOnBus {
public:
    explicit DaemonOnBus(const std::string& address)
        : _service(address, kDaemon, [this](const Message& request) { return answer(request); }) {}

    void failToCopyWith(Status status) {
        locked([&] { _copyStatus = status; });
    }
    void failWith(Status status) {
        locked([&] { _status = status; });
    }
    void answerWith(const Message& reply) {
        locked([&] { _reply = reply; });
    }
    std::vector<std::string> stored() {
        std::vector<std::string> tokens;
        locked([&] {
            for (const auto& [hash, token] : _stored) tokens.push_back(token);
        });
        return tokens;
    }
    Message last() {
        Message request;
        locked([&] { request = _last; });
        return request;
    }

private:
    template <typename Work>
    void locked(Work work) {
        const std::lock_guard lock(_mutex);
        work();
    }

    Message answer(const Message& request) {
        const std::lock_guard lock(_mutex);
        _last = request;
        if (_reply) return *_reply;
        const bool copies = request.unsignedInteger("op") == 8U;
        const auto status = copies ? _copyStatus : _status;
        Message reply;
        reply.set("res", std::int64_t{status});
        if (status != platform::kSuccess) return reply;
        if (copies) reply.set("str1", std::string("/org/example/login"));
        if (request.unsignedInteger("op") == 9U)
            _stored[*request.bytes("dat1")] = *request.text("str1");
        if (request.unsignedInteger("op") == 10U) _stored.erase(*request.bytes("dat1"));
        return reply;
    }

    std::mutex _mutex;
    Status _copyStatus = platform::kSuccess;
    Status _status = platform::kSuccess;
    std::optional<Message> _reply;
    std::map<Bytes, std::string> _stored;
    Message _last;
    BusService _service;
};

// The real class for whoever runs the test, a real bus, and a daemon on it.
class ServiceBackend {
public:
    ServiceBackend() { ::setenv("DBUS_SYSTEM_BUS_ADDRESS", _bus.address().c_str(), 1); }
    ~ServiceBackend() { ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS"); }
    ServiceBackend(const ServiceBackend&) = delete;
    ServiceBackend& operator=(const ServiceBackend&) = delete;

    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::ServiceKeychain& get() { return _keychain; }
    void failToCopyWith(Status status) { daemon->failToCopyWith(status); }
    void failWith(Status status) { daemon->failWith(status); }
    std::vector<std::string> stored() { return daemon->stored(); }

private:
    PrivateBus _bus;
    platform::ServiceKeychain _keychain{[] { return std::optional(::getuid()); }};

public:
    std::unique_ptr<DaemonOnBus> daemon = std::make_unique<DaemonOnBus>(_bus.address());
};

class ServiceKeychainTest : public contracts::ContractTest<ServiceBackend> {
protected:
    platform::ServiceKeychain& keychain() { return backend().get(); }
    DaemonOnBus& daemon() { return *backend().daemon; }

    const Bytes hash = Bytes(32, 0xAB);
    const Bytes wrapKeyHash = Bytes(32, 0xCD);
};

TEST_F(ServiceKeychainTest, AsksForTheKeyringOfTheUserAtTheConsole) {
    const auto copied = keychain().copyLoginKeychain();

    ASSERT_TRUE(copied.keychain);
    EXPECT_EQ(copied.keychain->name(), "/org/example/login");
    Message request;
    request.set("op", std::uint64_t{8});
    request.set("uid", std::int64_t{::getuid()});
    EXPECT_EQ(daemon().last(), request);
}

TEST_F(ServiceKeychainTest, SendsAllThatBelongsToAnUnlockKey) {
    const auto copied = keychain().copyLoginKeychain();
    ASSERT_TRUE(copied.keychain);

    keychain().storeUnlockKey(hash, "pkcs11:token=a", wrapKeyHash, *copied.keychain, "");

    Message request;
    request.set("op", std::uint64_t{9});
    request.set("uid", std::int64_t{::getuid()});
    request.set("dat1", hash);
    request.set("dat2", wrapKeyHash);
    request.set("str1", std::string("pkcs11:token=a"));
    request.set("str2", std::string("/org/example/login"));
    request.set("str3", std::string());
    EXPECT_EQ(daemon().last(), request);
}

TEST_F(ServiceKeychainTest, ErasesByTheNameOfTheAccount) {
    keychain().eraseUnlockKey(hash);

    Message request;
    request.set("op", std::uint64_t{10});
    request.set("str1", *platform::current().accounts().userName(::getuid()));
    request.set("dat1", hash);
    EXPECT_EQ(daemon().last(), request);
}

TEST_F(ServiceKeychainTest, SaysByAStatusOfItsOwnThatNobodyIsAtTheConsole) {
    platform::ServiceKeychain nobodys([] { return std::nullopt; });
    const auto copied = keychain().copyLoginKeychain();
    ASSERT_TRUE(copied.keychain);

    EXPECT_EQ(nobodys.copyLoginKeychain().status, -3001);
    EXPECT_EQ(nobodys.storeUnlockKey(hash, "a", wrapKeyHash, *copied.keychain, ""), -3001);
    EXPECT_EQ(nobodys.eraseUnlockKey(hash), -3001);
    EXPECT_EQ(daemon().last().unsignedInteger("op"), 8U) << "nothing more was asked";
}

TEST_F(ServiceKeychainTest, SaysByAStatusOfItsOwnThatThereIsNoService) {
    backend().daemon.reset();

    EXPECT_EQ(keychain().copyLoginKeychain().status, -3000);
    EXPECT_EQ(keychain().eraseUnlockKey(hash), -3000);
}

TEST_F(ServiceKeychainTest, TakesAnAnswerWithoutAStatusOrANameForNone) {
    struct Row {
        const char* why;
        Message::Value result;
    };
    for (const auto& [why, result] :
         {Row{"a text", std::string("0")}, Row{"unsigned", std::uint64_t{0}},
          Row{"no status", std::int64_t{1} << 40U}, Row{"no name beside it", std::int64_t{0}}}) {
        Message reply;
        reply.set("res", result);
        daemon().answerWith(reply);

        const auto copied = keychain().copyLoginKeychain();

        EXPECT_EQ(copied.status, -3000) << why;
        EXPECT_FALSE(copied.keychain) << why;
    }
}

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, KeychainContract, test::FakeKeychainBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Service, KeychainContract, test::ServiceBackend);
}  // namespace vlm::contracts
