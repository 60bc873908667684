#include "services/hints/logind_user_sessions.h"

#include <systemd/sd-login.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>

#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

int onReply(sd_bus_message* reply, void*, sd_bus_error*) {
    if (const auto* error = sd_bus_message_get_error(reply))
        kLog.error("logind did not do what a removed card asks for: {}",
                   error->message ? error->message : error->name);
    return 0;
}

}  // namespace

std::vector<std::string> LogindUserSessions::ids() const {
    char** list = nullptr;
    std::vector<std::string> ids;
    if (sd_uid_get_sessions(getuid(), 0, &list) < 0) return ids;
    for (char** each = list; each && *each; ++each) {
        ids.emplace_back(*each);
        std::free(*each);
    }
    std::free(list);
    return ids;
}

void LogindUserSessions::call(const char* method, const std::string& id) {
    const int code =
        _bus ? sd_bus_call_method_async(_bus, nullptr, "org.freedesktop.login1",
                                        "/org/freedesktop/login1", "org.freedesktop.login1.Manager",
                                        method, onReply, nullptr, "s", id.c_str())
             : -ENOTCONN;
    if (code < 0) kLog.error("logind cannot be asked for {}: {}", method, std::strerror(-code));
}

}  // namespace vlm::service
