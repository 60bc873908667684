#include "services/hints/prompter_registration.h"

#include <string_view>

#include "platform/text.h"
#include "services/hints/hints_log.h"
#include "services/hints/service_names.h"

namespace vlm::service {

bool PrompterRegistration::start() {
    const auto rule = platform::text(
        "type='signal',sender='org.freedesktop.DBus',path='/org/freedesktop/DBus',"
        "interface='org.freedesktop.DBus',member='NameOwnerChanged',arg0='{}'",
        kDaemonName);
    sd_bus_slot* slot = nullptr;
    if (sd_bus_add_match(_bus, &slot, rule.c_str(), onOwnerChanged, this) < 0) return false;
    _ownerChanged.reset(slot);
    registerNow();
    return true;
}

int PrompterRegistration::onOwnerChanged(sd_bus_message* signal, void* self, sd_bus_error*) {
    const char* name = nullptr;
    const char* before = nullptr;
    const char* now = nullptr;
    if (sd_bus_message_read(signal, "sss", &name, &before, &now) < 0) return 0;
    if (!std::string_view(now).empty()) static_cast<PrompterRegistration*>(self)->registerNow();
    return 0;
}

void PrompterRegistration::registerNow() {
    sd_bus_message* made = nullptr;
    if (sd_bus_message_new_method_call(_bus, &made, kDaemonName, kObjectPath, kPromptersInterface,
                                       "RegisterPrompter") < 0)
        return;
    const platform::SdBusMessage call(made);
    // Whoever needs the daemon starts it; then there is time enough to register.
    sd_bus_message_set_auto_start(made, 0);
    sd_bus_slot* slot = nullptr;
    if (sd_bus_call_async(_bus, &slot, made, onRegistered, this, 0) >= 0) _call.reset(slot);
}

int PrompterRegistration::onRegistered(sd_bus_message* reply, void*, sd_bus_error*) {
    const auto* error = sd_bus_message_get_error(reply);
    if (!error) {
        kLog.info("the daemon asks this user for PINs through this instance");
    } else if (!sd_bus_error_has_name(error, SD_BUS_ERROR_SERVICE_UNKNOWN) &&
               !sd_bus_error_has_name(error, SD_BUS_ERROR_NAME_HAS_NO_OWNER)) {
        kLog.error("the daemon cannot ask this user for PINs: {}",
                   error->message ? error->message : error->name);
    }
    return 0;
}

}  // namespace vlm::service
