// A question for a user's instance that may have yet to register: asked when it has, or when its
// time for that is over.
//
// `Question` is what the asking side holds, and what `ask` makes when the time has come.

#pragma once

#include <functional>
#include <memory>
#include <utility>

#include "services/hints/prompter_registry.h"
#include "services/hints/tokens/event_source.h"

namespace vlm::service {

template <typename Question>
class LateQuestion final : public Question {
public:
    using Ask = std::function<std::unique_ptr<Question>()>;

    LateQuestion(sd_event* event, PrompterRegistry& prompters, platform::UserId user, Ask ask)
        : _ask(std::move(ask)),
          _registered(prompters.callWhenRegistered(user, [this] { askNow(); })),
          _timeOver(callAfter(event, prompters.timeLeftToRegister(), [this] { askNow(); })) {}

private:
    void askNow() {
        _registered.reset();
        _timeOver.reset();
        _question = std::exchange(_ask, nullptr)();
    }

    Ask _ask;
    PrompterRegistry::Waiting _registered;
    EventSource _timeOver;
    std::unique_ptr<Question> _question;
};

}  // namespace vlm::service
