// BindUtils: what the command line, the agent and the pairing operation share: whether the pairing
// dialog may be offered, who is who on this machine, the text form of hashes, and the program's
// log.
//
// Shapes:   names and texts are UTF-8. The text form of binary data is two upper-case hexadecimal
//           digits per byte with nothing between them.
// Threads:  any; there is no state but the log handle.
// Blocking: looking up names and ids may wait for a directory server, the switches for the disk.
// Errors:   none are reported; each operation says what it answers instead.
// In tests: tests/unit/util/

#pragma once

#include <optional>
#include <string>

#include "platform/system_log.h"
#include "platform/types.h"

namespace vlm {

class BindUtils {
public:
    // The pairing dialog is offered where it is enabled for the machine and allowed by the user.
    // Two switches under one name, in records of their own: a user's "Do not show again" changes
    // nothing for others, and the machine's switch overrules no user.

    // The machine's switch. It is read like every smart-card setting, so management may decide it.
    // Setting it takes the right to write the machine's record; false when that could not be done.
    static bool setBindEnabled(bool enabled);
    static bool isBindEnabled();

    // The current user's switch. Only a boolean false disallows: whoever never decided is asked.
    // False from setting it when it could not be written.
    static bool setBindAllowed(bool allowed);
    static bool isBindAllowed();

    // The name of the process's real user; none when that user has no account.
    static std::optional<std::string> currentUserName();

    // The user's id; 0, which is the superuser's, when there is no such account.
    static platform::UserId userIdForUserName(const std::string& userName);

    static std::optional<std::string> userNameForUserId(platform::UserId userId);

    // The user who sits at this machine; kNobody when there is none, and also for the superuser.
    static platform::UserId currentLoggedInUserId();

    // The name of the user that this process runs as.
    static std::string processOwnerUserName();

    static std::optional<std::string> dataToHex(const std::optional<platform::Bytes>& data);

    // Reads hexadecimal text, spaces ignored. It is as lenient as can be: a last digit without
    // a partner is dropped, and a pair that is no number counts as far as it can be read. None
    // only for no text, or bytes that are no text.
    static std::optional<platform::Bytes> dataFromHex(const std::optional<std::string>& text);

    // The handle that every line of this program is logged through.
    static const platform::Log& log();
};

}  // namespace vlm
