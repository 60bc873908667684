#include "services/hints/session_tokens.h"

#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <utility>

#include "platform/linux/send_notification.h"
#include "platform/linux/session_bus_notifications.h"
#include "platform/token_framework.h"
#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

auto callingAfter(sd_event* event) {
    return [event](std::chrono::milliseconds delay, std::function<void()> call) {
        return std::shared_ptr<void>(callAfter(event, delay, std::move(call)));
    };
}

void postNewToken(sd_bus* bus, sd_bus_message_handler_t onAnswer) {
    const int result =
        platform::sendNotification(bus, std::string(platform::kNewTokenNotification), onAnswer);
    if (result < 0)
        kLog.error("the notification {} cannot be sent: {}", platform::kNewTokenNotification,
                   std::strerror(-result));
}

// An agent that is about to end takes no more; the next message starts another one.
int onAnswer(sd_bus_message* answer, void*, sd_bus_error*) {
    const sd_bus_error* error = sd_bus_message_get_error(answer);
    if (!error) return 0;
    if (sd_bus_error_has_name(error, platform::kLeavingError) != 0)
        postNewToken(sd_bus_message_get_bus(answer), nullptr);
    else
        kLog.error("the notification {} was not delivered: {}", platform::kNewTokenNotification,
                   error->message ? error->message : error->name);
    return 0;
}

}  // namespace

SessionTokens::SessionTokens(const Parts& parts)
    : _watches({parts.bus, parts.callers, _lookout}),
      _notice({.isUserAtConsole = isUserAtConsole,
               .post = [bus = parts.bus] { postNewToken(bus, onAnswer); },
               .callAfter = callingAfter(parts.event)}),
      _removal({.removed = parts.cardRemoved, .callAfter = callingAfter(parts.event)}),
      _lookout({.daemon = parts.daemon,
                .callAfter = callingAfter(parts.event),
                .inserted = [this](const std::string& token) { _watches.inserted(token); },
                .removed = [this](const std::string& token) { _watches.removed(token); },
                .looked =
                    [this] {
                        _watches.looked();
                        _notice.looked(_lookout.tokens(), _lookout.isCertain());
                        _removal.looked(_lookout.tokens(), _lookout.isCertain());
                    }}),
      _cards(parts.event, [this](CardEvent event) { cardEvent(event); }),
      _console(parts.event, [this] {
          _notice.consoleChanged();
          _cards.tryPcscdAgain();
      }) {}

void SessionTokens::cardEvent(CardEvent event) {
    switch (event) {
        case CardEvent::CardPulled:
            _notice.cardPulled();
            _removal.cardMoved();
            break;
        case CardEvent::CardMoved:
            _removal.cardMoved();
            break;
        case CardEvent::PcscdWent:
            _notice.pcscdWent();
            _removal.pcscdWent();
            break;
        case CardEvent::PcscdCame:
            _notice.pcscdCame();
            _removal.pcscdCame();
            break;
    }
    _lookout.cardEvent();
}

}  // namespace vlm::service
