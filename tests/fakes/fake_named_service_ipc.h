#pragma once

#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "platform/named_service_ipc.h"
#include "platform/token_framework.h"

namespace vlm::fakes {

// A world with the services that a test puts into it, and a record of every exchange.
class FakeNamedServiceIpc final : public platform::NamedServiceIpc {
public:
    struct Exchange {
        std::string service;
        platform::ServiceScope scope;
        platform::Message request;
    };
    using Service = std::function<platform::Message(const platform::Message& request)>;

    // What a test does to the world: every service answers like this from now on. Without it
    // no service can be reached.
    void serve(Service service) { _service = std::move(service); }

    // What happened.
    std::vector<Exchange> exchanges;
    int connections = 0;      // made
    int openConnections = 0;  // and not yet closed

    std::unique_ptr<platform::Connection> connect(std::string_view serviceName,
                                                  platform::ServiceScope scope) override {
        return std::make_unique<FakeConnection>(*this, std::string(serviceName), scope);
    }

private:
    class FakeConnection final : public platform::Connection {
    public:
        FakeConnection(FakeNamedServiceIpc& world, std::string service,
                       platform::ServiceScope scope)
            : _world(world), _service(std::move(service)), _scope(scope) {
            ++_world.connections;
            ++_world.openConnections;
        }
        FakeConnection(const FakeConnection&) = delete;
        FakeConnection& operator=(const FakeConnection&) = delete;
        ~FakeConnection() override { --_world.openConnections; }

        void setEventHandler(EventHandler handler) override { _handler = std::move(handler); }
        void resume() override { _resumed = true; }

        platform::Message sendAndWait(const platform::Message& request) override {
            if (!_resumed) return failed("the connection was not resumed");
            _world.exchanges.push_back({_service, _scope, request});
            if (_world._service) return _world._service(request);
            if (_handler) _handler(platform::ConnectionEvent::Invalid);
            return failed("there is no service " + _service);
        }

    private:
        static platform::Message failed(const std::string& why) {
            platform::Message reply;
            platform::encodeReplyError({std::string(platform::VLErrorDomain), -1, why}, &reply);
            return reply;
        }

        FakeNamedServiceIpc& _world;
        std::string _service;
        platform::ServiceScope _scope;
        EventHandler _handler;
        bool _resumed = false;
    };

    Service _service;
};

}  // namespace vlm::fakes
