#include "platform/linux/polkit_verdict.h"

#include <string_view>

namespace vlm::platform {

namespace {

int readDetails(sd_bus_message* answer, PolkitVerdict& verdict) {
    int result = sd_bus_message_enter_container(answer, 'a', "{ss}");
    if (result < 0) return result;
    const char* name = nullptr;
    const char* value = nullptr;
    while ((result = sd_bus_message_read(answer, "{ss}", &name, &value)) > 0) {
        const std::string_view detail = name;
        if (detail == "polkit.dismissed") verdict.isDismissed = true;
        if (detail == "polkit.temporary_authorization_id") verdict.keptId = value;
    }
    return result;
}

}  // namespace

int readPolkitVerdict(sd_bus_message* answer, PolkitVerdict& verdict) {
    int isAuthorized = 0;
    int isChallenge = 0;
    int result = sd_bus_message_enter_container(answer, 'r', "bba{ss}");
    if (result >= 0) result = sd_bus_message_read(answer, "bb", &isAuthorized, &isChallenge);
    if (result < 0) return result;
    verdict.isAuthorized = isAuthorized != 0;
    verdict.isChallenge = isChallenge != 0;
    return readDetails(answer, verdict);
}

}  // namespace vlm::platform
