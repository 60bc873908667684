#include "tests/contracts/token_watcher_contract.h"

#include <cstdlib>

#include "fake_token_framework.h"
#include "platform/linux/bus_token_watcher.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/token_service.h"

namespace vlm::test {

namespace {

class FakeTokensBackend : public contracts::FakeBackend<fakes::FakeTokenFramework> {
public:
    void insert(const std::string& token) { get().insert(token); }
    void pull(const std::string& token) { get().pull(token); }
    template <typename Condition>
    bool happens(Condition isSo) {
        get().deliver();
        return isSo();
    }
};

// The real class, a real bus, and a service on it.
class BusTokensBackend {
public:
    BusTokensBackend() { ::setenv("DBUS_SESSION_BUS_ADDRESS", _bus.address().c_str(), 1); }
    ~BusTokensBackend() { ::unsetenv("DBUS_SESSION_BUS_ADDRESS"); }

    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::BusTokenFramework& get() { return _framework; }
    void insert(const std::string& token) { _service.insert(token); }
    void pull(const std::string& token) { _service.pull(token); }
    template <typename Condition>
    bool happens(Condition isSo) {
        return eventually(isSo);
    }

private:
    PrivateBus _bus;
    TokenService _service{_bus.address()};
    platform::BusTokenFramework _framework;
};

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, TokenWatcherContract, test::FakeTokensBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(Bus, TokenWatcherContract, test::BusTokensBackend);
}  // namespace vlm::contracts
