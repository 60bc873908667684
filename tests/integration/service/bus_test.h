// BusTest: a private bus and an event loop for what speaks on it in the test's own process.

#pragma once

#include <gtest/gtest.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <deque>
#include <functional>
#include <memory>
#include <utility>
#include <vector>

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/sd_bus_message.h"
#include "platform_test.h"
#include "services/hints/exchanges.h"
#include "services/hints/service_names.h"
#include "tests/integration/linux/private_bus.h"

namespace vlm::service {

// Keeps every request until the test answers it.
class PatientExchanges final : public Exchanges {
public:
    struct Request {
        Caller caller;
        IncomingRequest request;
        Reply reply;
    };
    std::deque<Request> waiting;

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override {
        waiting.push_back({caller, request, std::move(reply)});
    }
};

class BusTest : public fakes::PlatformTest {
protected:
    BusTest() {
        setenv("DBUS_SYSTEM_BUS_ADDRESS", bus.address().c_str(), 1);
        sd_event* made = nullptr;
        sd_event_new(&made);
        _event.reset(made);
    }

    sd_event* event() const { return _event.get(); }

    platform::SdBus connect() {
        sd_bus* made = nullptr;
        sd_bus_new(&made);
        platform::SdBus connection(made);
        sd_bus_set_address(made, bus.address().c_str());
        sd_bus_set_bus_client(made, 1);
        EXPECT_GE(sd_bus_start(made), 0);
        EXPECT_FALSE(nameOf(made).empty());
        sd_bus_attach_event(made, event(), 0);
        return connection;
    }
    static std::string nameOf(sd_bus* connection) {
        const char* name = nullptr;
        return sd_bus_get_unique_name(connection, &name) < 0 ? "" : name;
    }

    void send(sd_bus* from, const std::string& to, std::uint64_t operation) {
        const auto call = callTo(from, to, operation);
        ASSERT_GE(sd_bus_call_async(from, nullptr, call.get(), onReply, this, UINT64_MAX), 0);
    }
    void sendAndWantNoAnswer(sd_bus* from, const std::string& to, std::uint64_t operation) {
        const auto call = callTo(from, to, operation);
        sd_bus_message_set_expect_reply(call.get(), 0);
        ASSERT_GE(sd_bus_send(from, call.get(), nullptr), 0);
    }

    void runUntil(const std::function<bool()>& isSo) {
        while (!isSo()) ASSERT_GT(sd_event_run(event(), 10'000'000), 0) << "nothing happens";
    }
    void runUntilQuiet() {
        while (sd_event_run(event(), 100'000) > 0) {
        }
    }

private:
    static platform::SdBusMessage callTo(sd_bus* from, const std::string& to,
                                         std::uint64_t operation) {
        sd_bus_message* made = nullptr;
        sd_bus_message_new_method_call(from, &made, to.c_str(), kObjectPath, kHintsInterface,
                                       "Exchange");
        platform::SdBusMessage call(made);
        platform::Message request;
        request.set("op", operation);
        std::string reason;
        EXPECT_TRUE(platform::appendDictionary(made, request, reason)) << reason;
        return call;
    }
    static int onReply(sd_bus_message* message, void* self, sd_bus_error*) {
        std::string reason;
        const auto read = platform::readDictionary(message, reason);
        auto& test = *static_cast<BusTest*>(self);
        test.replies.push_back(read ? read->message.integer("res").value_or(-1) : -2);
        std::uint64_t number = 0;
        sd_bus_message_get_cookie(message, &number);
        test.numbersOfReplies.push_back(number);
        return 1;
    }

    struct EventUnref {
        void operator()(sd_event* event) const { sd_event_unref(event); }
    };

protected:
    test::PrivateBus bus;
    std::vector<std::int64_t> replies;
    // Each among all the messages that its sender has sent.
    std::vector<std::uint64_t> numbersOfReplies;

private:
    std::unique_ptr<sd_event, EventUnref> _event;
};

}  // namespace vlm::service
