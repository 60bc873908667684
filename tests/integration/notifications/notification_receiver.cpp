// Stands in for the agent on the session bus until the bus ends:
//
//     notification_receiver FILE [deaf|absent|answering]
//
// Writes "ready" and then each name that is delivered to it as a line of the file and on standard
// output. A deaf one takes its name and nothing after that; an absent one never takes its name. Who
// waits for an answer is told of in place of the name, but by an answering one.

#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <iostream>
#include <string>
#include <string_view>

#include "platform/linux/sd_bus_handles.h"
#include "platform/linux/session_bus_notifications.h"

namespace {

using namespace vlm::platform;

std::ofstream file;
bool isAnswering = false;

void tell(const char* line) {
    file << line << std::endl;
    std::cout << line << std::endl;
}

int deliver(sd_bus_message* delivery, void*, sd_bus_error*) {
    const char* name = nullptr;
    const int result = sd_bus_message_read(delivery, "s", &name);
    if (result < 0) return result;
    const bool isAwaited = sd_bus_message_get_expect_reply(delivery) != 0;
    tell(isAwaited && !isAnswering ? "a reply is expected" : name);
    return sd_bus_reply_method_return(delivery, "");
}

const sd_bus_vtable kMethods[] = {
    SD_BUS_VTABLE_START(0),
    SD_BUS_METHOD(kDeliverMethod, "s", "", deliver, SD_BUS_VTABLE_UNPRIVILEGED),
    SD_BUS_VTABLE_END,
};

}  // namespace

int main(int argc, char* argv[]) {
    if (argc < 2) return EXIT_FAILURE;
    file.open(argv[1], std::ios::app);
    const std::string_view manner = argc > 2 ? argv[2] : "";
    isAnswering = manner == "answering";

    sd_bus* opened = nullptr;
    if (sd_bus_open_user(&opened) < 0) return EXIT_FAILURE;
    const SdBus bus(opened);
    if (sd_bus_add_object_vtable(bus.get(), nullptr, kNotificationsObject, kNotificationsInterface,
                                 kMethods, nullptr) < 0)
        return EXIT_FAILURE;
    if (manner != "absent") {
        if (sd_bus_request_name(bus.get(), kNotificationsService, 0) < 0) return EXIT_FAILURE;
        tell("ready");
    }
    while (manner == "deaf") pause();
    while (sd_bus_is_open(bus.get()) > 0) {
        const int result = sd_bus_process(bus.get(), nullptr);
        if (result < 0) break;
        if (result == 0) sd_bus_wait(bus.get(), UINT64_MAX);
    }
    return EXIT_SUCCESS;
}
