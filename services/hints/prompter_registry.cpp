#include "services/hints/prompter_registry.h"

#include <algorithm>
#include <utility>

#include "services/hints/hints_log.h"
#include "services/hints/service_names.h"

namespace vlm::service {

const sd_bus_vtable PrompterRegistry::kMembers[] = {
    SD_BUS_VTABLE_START(0),
    SD_BUS_METHOD("RegisterPrompter", "", "", onRegister, SD_BUS_VTABLE_UNPRIVILEGED),
    SD_BUS_VTABLE_END,
};

bool PrompterRegistry::start() {
    sd_bus_slot* slot = nullptr;
    if (sd_bus_add_object_vtable(_bus, &slot, kObjectPath, kPromptersInterface, kMembers, this) < 0)
        return false;
    _slot.reset(slot);
    _registrationEnds = _clock() + kTimeToRegister.count();
    return true;
}

std::optional<std::string> PrompterRegistry::prompterOf(platform::UserId user) const {
    const auto found = _prompters.find(user);
    if (found == _prompters.end()) return std::nullopt;
    return found->second.connection;
}

std::chrono::milliseconds PrompterRegistry::timeLeftToRegister() const {
    return std::chrono::milliseconds(std::max(_registrationEnds - _clock(), std::int64_t{0}));
}

PrompterRegistry::Waiting PrompterRegistry::callWhenRegistered(platform::UserId user,
                                                               std::function<void()> call) {
    auto waiting = std::make_shared<const std::function<void()>>(std::move(call));
    _waiting.emplace(user, waiting);
    return waiting;
}

int PrompterRegistry::onRegister(sd_bus_message* call, void* self, sd_bus_error*) {
    auto& registry = *static_cast<PrompterRegistry*>(self);
    const auto caller = registry._callers.senderOf(call);
    if (!caller) return 1;
    if (registry.prompterOf(caller->user) != caller->connection)
        registry.add(caller->user, caller->connection);
    return sd_bus_reply_method_return(call, nullptr);
}

void PrompterRegistry::add(platform::UserId user, const std::string& connection) {
    auto watch = _watch.watch(connection, [this, user, connection] {
        const auto found = _prompters.find(user);
        if (found != _prompters.end() && found->second.connection == connection)
            _prompters.erase(found);
    });
    if (!watch) return;
    _prompters[user] = {connection, std::move(watch)};
    kLog.info("user {} is asked for PINs through {}", user, connection);
    while (const auto waiting = _waiting.extract(user))
        if (const auto call = waiting.mapped().lock()) (*call)();
}

}  // namespace vlm::service
