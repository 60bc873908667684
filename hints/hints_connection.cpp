#include "hints/hints_connection.h"

#include <algorithm>
#include <string>
#include <utility>

#include "hints/hints_log.h"
#include "platform/console_sessions.h"
#include "platform/platform.h"
#include "platform/process_info.h"

namespace vlm::hints {

using platform::ServiceScope;
using platform::String;
using platform::UserId;

namespace {

bool mustAskDaemon() {
    return getUidForAgent() == platform::kNobody ||
           platform::current().processInfo().effectiveUserId() == 0;
}

// Zeros for text that may be a PIN. They always lie on the heap, since a short string that is moved
// away leaves its characters behind; the message that the text goes to wipes it there.
std::string roomForText(std::size_t size) {
    std::string room;
    room.reserve(std::max(size, sizeof(std::string)));
    room.resize(size);
    return room;
}

void wipe(std::string text) { platform::Message().set("text", std::move(text)); }

}  // namespace

std::int64_t userIdNumber(UserId userId) {
    return userId == platform::kNobody ? -1 : std::int64_t{userId};
}

UserId getUidForAgent() {
    log().debug("getUidForAgent");
    UserId found = 0;
    if (const auto sessions = platform::current().consoleSessions().sessions()) {
        const auto atConsole =
            std::ranges::find_if(*sessions, &platform::ConsoleSession::onConsole);
        if (atConsole != sessions->end()) found = atConsole->userId;
    }
    log().debug("active session uid: {}", userIdNumber(found));
    return found == 0 ? platform::kNobody : found;
}

std::unique_ptr<platform::Connection> setupConnection(platform::Connection::EventHandler handler,
                                                      bool forceDaemon) {
    const bool daemon = forceDaemon || mustAskDaemon();
    log().debug("setupConnection, forceDaemon {}", daemon);

    auto& ipc = platform::current().namedServiceIpc();
    auto connection = daemon ? ipc.connect(kDaemonService, ServiceScope::Machine)
                             : ipc.connect(kAgentService, ServiceScope::User);
    connection->setEventHandler(std::move(handler));
    connection->resume();
    return connection;
}

bool setStringToMsgObject(platform::Message* message, std::string_view key, const String& string) {
    if (const auto direct = string.directUtf8()) {
        auto utf8 = roomForText(direct->size());
        std::ranges::copy(*direct, utf8.begin());
        message->set(key, std::move(utf8));
        return true;
    }

    // The buffer has no byte to spare for the terminator, so text that fills it is refused; every
    // client of this service draws the line there.
    auto utf8 = roomForText(String::maximumUtf8Size(string.length()));
    if (!string.copyUtf8(utf8)) {
        wipe(std::move(utf8));
        return false;
    }
    utf8.resize(utf8.find_last_not_of('\0') + 1);
    message->set(key, std::move(utf8));
    return true;
}

}  // namespace vlm::hints
