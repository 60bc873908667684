// Named services on D-Bus: the machine's on the system bus, the user's own on the session bus.
//
// An exchange is one call of the method Exchange of the service's object. A connection opens a bus
// connection of its own with its first exchange and again after the bus went away.

#pragma once

#include "platform/named_service_ipc.h"

namespace vlm::platform {

inline constexpr const char* kExchangeObject = "/org/vlm/token/hints";
inline constexpr const char* kExchangeInterface = "org.vlm.token.hints";
inline constexpr const char* kExchangeMethod = "Exchange";

class SdBusNamedServiceIpc final : public NamedServiceIpc {
public:
    std::unique_ptr<Connection> connect(std::string_view serviceName, ServiceScope scope) override;
};

}  // namespace vlm::platform
