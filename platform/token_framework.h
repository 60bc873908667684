// The token framework's names, and how a reply carries an error.
//
// Threads: any. Errors: a reply whose error entry cannot be read still counts as failed.
// In tests: tests/unit/platform/token_framework_test.cpp

#pragma once

#include <string_view>

#include "platform/message.h"
#include "platform/types.h"

namespace vlm::platform {

// The framework's identifier: log subsystem and prefix of its service names.
inline constexpr std::string_view kTokenFramework = "org.vlm.token";

// The notification that a token was inserted; posted once for each token that comes.
inline constexpr std::string_view kNewTokenNotification = "org.vlm.token.new-token";

// The domain of the errors that the framework and its clients make.
inline constexpr std::string_view VLErrorDomain = "VLErrorDomain";

// True when the reply carries no error. Otherwise false, and the error, always in VLErrorDomain,
// is stored in the place when one is given.
bool decodeReplyError(const Message& reply, ErrorPlace place);

// Puts an error into a reply, where decodeReplyError() finds it: key "err", a binary property list
// of "domain", "code" and "description".
void encodeReplyError(const Error& error, Message* reply);

}  // namespace vlm::platform
