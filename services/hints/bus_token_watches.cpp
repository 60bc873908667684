#include "services/hints/bus_token_watches.h"

#include <unistd.h>

#include <utility>

#include "services/hints/hints_log.h"
#include "services/hints/permission.h"
#include "services/hints/service_names.h"

namespace vlm::service {

namespace {

// What the daemon is asked for: the tokens, for the user whom this instance serves.
Request tokensOfThisUser() {
    Request request;
    request.operation = Operation::TokenInfo;
    request.user = getuid();
    return request;
}

}  // namespace

BusTokenWatches::BusTokenWatches(Parts parts)
    : _parts(parts),
      // Anyone may call: who may watch is decided for each call.
      _members{{SD_BUS_VTABLE_START(0),
                SD_BUS_METHOD_WITH_ARGS("Watch", SD_BUS_NO_ARGS, SD_BUS_RESULT("as", tokens),
                                        onWatch, SD_BUS_VTABLE_UNPRIVILEGED),
                SD_BUS_SIGNAL_WITH_ARGS("Inserted", SD_BUS_ARGS("s", token), 0),
                SD_BUS_SIGNAL_WITH_ARGS("Removed", SD_BUS_ARGS("s", token), 0),
                SD_BUS_VTABLE_END}} {}

bool BusTokenWatches::start() {
    sd_bus_slot* slot = nullptr;
    if (sd_bus_add_object_vtable(_parts.bus, &slot, kObjectPath, kTokensInterface, _members.data(),
                                 this) < 0)
        return false;
    _slot.reset(slot);
    return true;
}

int BusTokenWatches::onWatch(sd_bus_message* call, void* self, sd_bus_error*) {
    return static_cast<BusTokenWatches*>(self)->watch(call);
}

int BusTokenWatches::watch(sd_bus_message* call) {
    const auto caller = _callers.senderOf(call);
    if (!caller) return 1;
    if (const auto refusal = refusalFor(*caller, tokensOfThisUser())) {
        kLog.notice("refused for user {}: {} ({})", caller->user, refusal->text, refusal->status);
        return sd_bus_reply_method_errorf(call, SD_BUS_ERROR_ACCESS_DENIED, "%s",
                                          refusal->text.c_str());
    }
    if (_watchers.size() >= kMostWatchers || _waiting.size() >= kMostWaiting)
        return sd_bus_reply_method_errorf(call, SD_BUS_ERROR_LIMITS_EXCEEDED,
                                          "Too many programs watch the cards already.");
    auto& watch = _watchers[caller->connection];
    if (!watch)
        watch = _parts.callers.watch(caller->connection,
                                     [this, who = caller->connection] { leave(who); });
    // It has left already.
    if (!watch) return leave(caller->connection), 1;
    _parts.lookout.setWatched(true);
    if (_isKnown)
        answer(call);
    else
        _waiting.emplace_back(sd_bus_message_ref(call));
    return 1;
}

void BusTokenWatches::leave(const std::string& connection) {
    _watchers.erase(connection);
    if (!_watchers.empty()) return;
    _waiting.clear();
    _isKnown = false;
    _parts.lookout.setWatched(false);
}

void BusTokenWatches::looked() {
    _isKnown = !_watchers.empty();
    for (const auto& call : std::exchange(_waiting, {})) answer(call.get());
}

void BusTokenWatches::answer(sd_bus_message* call) {
    sd_bus_message* made = nullptr;
    if (sd_bus_message_new_method_return(call, &made) < 0) return;
    const platform::SdBusMessage reply(made);
    int result = sd_bus_message_open_container(made, 'a', "s");
    for (const auto& token : _parts.lookout.tokens())
        if (result >= 0) result = sd_bus_message_append_basic(made, 's', token.c_str());
    if (result >= 0) result = sd_bus_message_close_container(made);
    if (result >= 0) sd_bus_send(_parts.bus, made, nullptr);
}

// Those who wait for the first look are told all of it in one.
void BusTokenWatches::tell(const char* signal, const std::string& token) {
    if (_isKnown)
        sd_bus_emit_signal(_parts.bus, kObjectPath, kTokensInterface, signal, "s", token.c_str());
}

}  // namespace vlm::service
