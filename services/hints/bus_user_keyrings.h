// The login keyrings of the users whose instances have registered. A daemon that has just started
// waits a moment for the one that it needs.
//
// In tests: tests/integration/service/bus_user_keyrings_test.cpp

#pragma once

#include <systemd/sd-event.h>

#include <chrono>
#include <functional>
#include <memory>
#include <string>

#include "platform/message.h"
#include "services/hints/prompter_registry.h"
#include "services/hints/user_keyrings.h"

namespace vlm::service {

class BusUserKeyrings final : public UserKeyrings {
public:
    // How long is waited for an instance, and for a person in front of one.
    struct Patience {
        std::chrono::milliseconds machine{30'000};
        std::chrono::milliseconds person{600'000};
    };

    BusUserKeyrings(sd_event* event, PrompterRegistry& prompters, Patience patience)
        : _event(event), _prompters(prompters), _patience(patience) {}

    std::unique_ptr<Question> name(platform::UserId user,
                                   std::function<void(Outcome<std::string>)> answer) override;
    std::unique_ptr<Question> askPassword(platform::UserId user, const KeyringQuestion& question,
                                          std::function<void(Outcome<Secret>)> answer) override;
    std::unique_ptr<Question> unlock(platform::UserId user, const Secret& password,
                                     std::function<void(std::optional<Refusal>)> answer) override;

    // No person from now on, because the daemon is about to end. Open questions stay.
    void askNobody() { _isEnding = true; }

private:
    using Answer = std::function<void(Outcome<platform::Message>)>;

    struct Call {
        const char* method;
        platform::Message request;
        std::chrono::milliseconds patience;
        Answer answer;
    };

    std::unique_ptr<Question> ask(platform::UserId user, Call call);
    std::unique_ptr<Question> askNow(platform::UserId user, Call call);

    sd_event* _event;
    PrompterRegistry& _prompters;
    const Patience _patience;
    bool _isEnding = false;
};

}  // namespace vlm::service
