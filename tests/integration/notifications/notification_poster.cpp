// Posts a notification as the platform does:
//
//     notification_poster NAME [PATIENCE]      in milliseconds

#include <chrono>
#include <cstdlib>

#include "platform/linux/session_bus_notifications.h"
#include "platform/platform.h"

int main(int argc, char* argv[]) {
    if (argc < 2) return EXIT_FAILURE;
    if (argc == 2) {
        vlm::platform::current().notifications().post(argv[1]);
    } else {
        const std::chrono::milliseconds patience(std::strtol(argv[2], nullptr, 10));
        vlm::platform::SessionBusNotifications(patience).post(argv[1]);
    }
    return EXIT_SUCCESS;
}
