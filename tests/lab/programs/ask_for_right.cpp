// Asks for the right to pair, as the pairing window does, and prints the status. Then asks again in
// a session of its own for each line of standard input.

#include <iostream>
#include <string>

#include "platform/authorization.h"
#include "platform/platform.h"
#include "util/tool_identifier.h"

int main() {
    using vlm::platform::current;
    std::string line;
    do {
        auto created = current().authorization().createSession();
        if (created.session)
            created.status = created.session->request(
                vlm::kAdminRight, {.interactionAllowed = true, .extendRights = true});
        std::cout << created.status << std::endl;
    } while (std::getline(std::cin, line));
}
