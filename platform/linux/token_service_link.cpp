#include "platform/linux/token_service_link.h"

#include <cerrno>
#include <ctime>
#include <optional>
#include <string_view>
#include <system_error>

#include "platform/linux/readable_text.h"
#include "platform/system_log.h"
#include "platform/text.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "tokens");

// The service answers when it knows; a card may be slow, and the daemon may have to start.
constexpr std::uint64_t kNoTimeOut = UINT64_MAX;
constexpr std::uint64_t kAccuracyMicroseconds = 100'000;
constexpr std::size_t kMostReasonBytes = 512;

std::string systemText(int result) { return std::generic_category().message(-result); }

std::optional<std::string> textIn(sd_bus_message* message) {
    const char* text = nullptr;
    if (sd_bus_message_read_basic(message, 's', &text) <= 0) return std::nullopt;
    return text;
}

std::optional<std::set<std::string>> textsIn(sd_bus_message* message) {
    if (sd_bus_message_enter_container(message, 'a', "s") < 0) return std::nullopt;
    std::set<std::string> texts;
    while (auto text = textIn(message)) texts.insert(std::move(*text));
    return texts;
}

}  // namespace

void TokenServiceLink::connect() {
    int result = openBus();
    if (result >= 0) result = listen();
    if (result < 0) {
        _isLost = true;
        return failed(text("the session bus cannot be reached ({})", systemText(result)));
    }
    _isLost = false;
    watch();
}

int TokenServiceLink::openBus() {
    _watch.reset();
    for (auto* slot : {&_inserted, &_removed, &_ownerChanged, &_disconnected}) slot->reset();
    sd_bus* opened = nullptr;
    const int result = sd_bus_open_user(&opened);
    _bus.reset(result < 0 ? nullptr : opened);
    return result < 0 ? result : sd_bus_attach_event(opened, _event, SD_EVENT_PRIORITY_NORMAL);
}

// Before the tokens are asked for, so that no change falls in between.
int TokenServiceLink::listen() {
    const auto changes =
        text("type='signal',sender='{}',path='{}',interface='{}',member=", kTokensService,
             kTokensObject, kTokensInterface);
    const auto owner = text(
        "type='signal',sender='org.freedesktop.DBus',path='/org/freedesktop/DBus',"
        "interface='org.freedesktop.DBus',member='NameOwnerChanged',arg0='{}'",
        kTokensService);
    constexpr const char* kGone =
        "type='signal',sender='org.freedesktop.DBus.Local',"
        "interface='org.freedesktop.DBus.Local',member='Disconnected'";
    int result = addMatch((changes + "'Inserted'").c_str(), onInserted, _inserted);
    if (result >= 0) result = addMatch((changes + "'Removed'").c_str(), onRemoved, _removed);
    if (result >= 0) result = addMatch(owner.c_str(), onOwnerChanged, _ownerChanged);
    if (result >= 0) result = addMatch(kGone, onDisconnected, _disconnected);
    return result;
}

// A bus that does not take a match ends the connection.
int TokenServiceLink::addMatch(const char* rule, sd_bus_message_handler_t handler,
                               SdBusSlot& slot) {
    sd_bus_slot* made = nullptr;
    const int result = sd_bus_add_match_async(_bus.get(), &made, rule, handler, nullptr, this);
    slot.reset(made);
    return result;
}

void TokenServiceLink::watch() {
    _retry.reset();
    if (const int result = callWatch(); result < 0) failed(systemText(result));
}

int TokenServiceLink::callWatch() {
    sd_bus_message* made = nullptr;
    int result = sd_bus_message_new_method_call(_bus.get(), &made, kTokensService, kTokensObject,
                                                kTokensInterface, "Watch");
    const SdBusMessage call(made);
    if (result < 0) return result;
    sd_bus_slot* slot = nullptr;
    result = sd_bus_call_async(_bus.get(), &slot, made, onWatched, this, kNoTimeOut);
    _watch.reset(slot);
    return result;
}

void TokenServiceLink::takeAnswer(sd_bus_message* answer) {
    if (const auto* error = sd_bus_message_get_error(answer))
        return failed(error->message ? error->message : error->name);
    const auto tokens = textsIn(answer);
    if (!tokens) return failed("its answer cannot be understood");
    if (std::exchange(_isFailing, false))
        kLog.notice("The hints service tells again which tokens come and go.");
    _pause.reset();
    _listener.all(*tokens);
}

void TokenServiceLink::failed(const std::string& why) {
    if (!std::exchange(_isFailing, true))
        kLog.error("The hints service {} does not tell which tokens come and go: {}.",
                   kTokensService, readable(why, kMostReasonBytes));
    retry();
}

// Once, after the next pause.
void TokenServiceLink::retry() {
    const auto pause = std::chrono::duration_cast<std::chrono::microseconds>(_pause.next()).count();
    sd_event_source* source = nullptr;
    sd_event_add_time_relative(_event, &source, CLOCK_MONOTONIC, static_cast<std::uint64_t>(pause),
                               kAccuracyMicroseconds, onRetry, this);
    _retry.reset(source);
}

// The connection that ends is still in use here; it is replaced when the pause is over.
void TokenServiceLink::loseBus() {
    _isLost = true;
    _watch.reset();
    failed("the session bus went away");
}

int TokenServiceLink::onWatched(sd_bus_message* answer, void* self, sd_bus_error*) {
    auto& link = *static_cast<TokenServiceLink*>(self);
    link._watch.reset();
    // A connection that ends answers all calls; that is told once.
    if (!link._isLost) link.takeAnswer(answer);
    return 0;
}

int TokenServiceLink::onInserted(sd_bus_message* signal, void* self, sd_bus_error*) {
    if (const auto token = textIn(signal))
        static_cast<TokenServiceLink*>(self)->_listener.inserted(*token);
    return 0;
}

int TokenServiceLink::onRemoved(sd_bus_message* signal, void* self, sd_bus_error*) {
    if (const auto token = textIn(signal))
        static_cast<TokenServiceLink*>(self)->_listener.removed(*token);
    return 0;
}

// A service that is there anew knows nothing of this watcher. One that went is started again, after
// the time in which it comes back by itself.
int TokenServiceLink::onOwnerChanged(sd_bus_message* signal, void* self, sd_bus_error*) {
    auto& link = *static_cast<TokenServiceLink*>(self);
    const char* name = nullptr;
    const char* before = nullptr;
    const char* now = nullptr;
    if (link._isLost || sd_bus_message_read(signal, "sss", &name, &before, &now) < 0) return 0;
    if (!std::string_view(now).empty())
        link.watch();
    else if (!link._watch)
        link.retry();
    return 0;
}

int TokenServiceLink::onDisconnected(sd_bus_message*, void* self, sd_bus_error*) {
    static_cast<TokenServiceLink*>(self)->loseBus();
    return 0;
}

int TokenServiceLink::onRetry(sd_event_source*, std::uint64_t, void* self) {
    auto& link = *static_cast<TokenServiceLink*>(self);
    link._isLost ? link.connect() : link.watch();
    return 0;
}

}  // namespace vlm::platform
