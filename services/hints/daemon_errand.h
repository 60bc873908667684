// DaemonErrand: something that the user's instance does for the daemon, and for nobody else.
//
// Ownership: its parts outlive it. Threads: the event loop's. Blocking: never.
// Errors:    a refusal. A caller that leaves takes along what was begun for it.
// In tests:  tests/unit/services/pin_asking_test.cpp, keyring_errands_test.cpp

#pragma once

#include <cstdint>
#include <map>
#include <memory>

#include "services/hints/exchanges.h"
#include "services/hints/outcome.h"

namespace vlm::service {

class DaemonErrand : public Exchanges {
public:
    explicit DaemonErrand(CallerWatch& callers) : _callers(callers) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) final;

protected:
    using Work = std::shared_ptr<void>;

    // Begins what the request asks for; dropping the work gives it up. Replies once, never before
    // this has returned; a refusal is replied here.
    virtual Outcome<Work> begin(const Caller& caller, const platform::Message& request,
                                Reply reply) = 0;

private:
    struct Begun {
        Work work;
        std::unique_ptr<CallerWatch::Watch> watch;
    };

    CallerWatch& _callers;
    std::map<std::uint64_t, Begun> _begun;
    std::uint64_t _last = 0;
};

}  // namespace vlm::service
