#include "tests/contracts/named_service_ipc_contract.h"

#include <cstdlib>

#include "fake_named_service_ipc.h"
#include "platform/linux/sd_bus_named_service_ipc.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::test {

namespace {

constexpr const char* kService = "org.vlm.test.service";

class FakeIpcBackend : public contracts::FakeBackend<fakes::FakeNamedServiceIpc> {
public:
    void serve(fakes::FakeNamedServiceIpc::Service service) { get().serve(std::move(service)); }
};

// The real class, a real bus, and a service on it.
class SdBusBackend {
public:
    SdBusBackend() { ::setenv("DBUS_SYSTEM_BUS_ADDRESS", _bus.address().c_str(), 1); }
    ~SdBusBackend() { ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS"); }

    std::optional<std::string> unavailable() { return std::nullopt; }
    platform::SdBusNamedServiceIpc& get() { return _ipc; }
    void serve(BusService::Answer answer) {
        _service = std::make_unique<BusService>(_bus.address(), kService, std::move(answer));
    }

private:
    PrivateBus _bus;
    platform::SdBusNamedServiceIpc _ipc;
    std::unique_ptr<BusService> _service;
};

}  // namespace

}  // namespace vlm::test

namespace vlm::contracts {
INSTANTIATE_TYPED_TEST_SUITE_P(Fake, NamedServiceIpcContract, test::FakeIpcBackend);
INSTANTIATE_TYPED_TEST_SUITE_P(SdBus, NamedServiceIpcContract, test::SdBusBackend);
}  // namespace vlm::contracts
