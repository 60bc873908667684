// TokenService: tells on a bus which tokens come and go, as the user's hints service does; the test
// inserts and pulls them.
//
// Threads: the test's; calls from the bus are answered on a thread of its own.
// Errors:  the constructor throws when the service cannot be put on the bus.

#pragma once

#include <condition_variable>
#include <mutex>
#include <set>
#include <string>
#include <thread>

#include "platform/linux/sd_bus_handles.h"
#include "tests/integration/linux/bus_service.h"

namespace vlm::test {

class TokenService {
public:
    // With these tokens in.
    explicit TokenService(const std::string& address, std::set<std::string> tokens = {});
    // The service leaves the bus.
    ~TokenService();
    TokenService(const TokenService&) = delete;
    TokenService& operator=(const TokenService&) = delete;

    // Answers the requests for this service too from now on, on the thread of its own.
    void answerRequests(const BusService::Answer& answer);

    void insert(const std::string& token);
    void pull(const std::string& token);

    // Whether it is asked for the tokens that often before the patience of a test is over.
    bool isAsked(int times = 1);

    // Answers nobody from now on, or the next one only with an error.
    void hold();
    void refuseOnce();

private:
    static int onRequest(sd_bus_message* call, void* self, sd_bus_error* error);
    static int onWatch(sd_bus_message* call, void* self, sd_bus_error* error);
    int answer(sd_bus_message* call);
    void emit(const char* signal, const std::string& token);
    void run();

    const sd_bus_vtable _members[5];
    const sd_bus_vtable _requests[3];
    platform::SdBus _bus;
    platform::SdBusSlot _object;
    platform::SdBusSlot _requestsObject;
    int _stop = -1;

    std::mutex _mutex;  // of all that follows, and of the bus
    std::condition_variable _asked;
    BusService::Handler _answerRequest;
    std::set<std::string> _tokens;
    int _timesAsked = 0;
    bool _isHeld = false;
    bool _refusesNext = false;

    std::thread _thread;
};

}  // namespace vlm::test
