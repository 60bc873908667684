// One exchange with the hints service: what requests have in common, and how replies are read.
//
// Shapes:  a request begins with "op"; "dat1" is bytes, "str1" to "str3" text, "uid" and "num1"
//          signed numbers. A reply's "res" is a status number or a serialised property list.
// Threads: any.
// Errors:  a reply is read with care: a "res" of another type, or a number that is no status,
//          counts as absent.

#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>

#include "platform/message.h"
#include "platform/named_service_ipc.h"
#include "platform/property_list.h"
#include "platform/string.h"
#include "platform/types.h"

namespace vlm::hints {

enum class Operation : std::uint64_t {
    PerformLogin = 0,
    CopyAvailableTokensInfo = 1,
    BindUser = 2,
    UnbindUser = 3,
    CopyLegacyBindings = 4,
    UnlockKeybag = 5,
    IsUserBound = 6,
    CopyTokenEndpoints = 7,
};

enum class Instance { Daemon, ByRule };

platform::Message makeRequest(Operation operation);

// Puts the text under "str1", "str2" or "str3". An absent text cannot be converted; the failure is
// logged in the name of the function that wanted to send it.
bool setString(platform::Message* request, int ordinal,
               const std::optional<platform::String>& string, std::string_view function);

void setUserId(platform::Message* request, platform::UserId userId);

// The user for whom 0 stands is looked up anew.
platform::UserId userOrConsoleUser(platform::UserId userId);

// A fresh connection. Its events are ignored: all that can go wrong shows in the reply.
std::unique_ptr<platform::Connection> connectTo(Instance instance);

// The reply's status, whether or not it carries an error too; kNoStatus when there is none.
platform::Status readStatus(const platform::Message& reply);

// The status of a reply without an error; kNoStatus for every other reply.
platform::Status readStatusUnlessFailed(const platform::Message& reply);

// The property list of a reply without an error.
std::optional<platform::PropertyList> readPropertyListUnlessFailed(const platform::Message& reply);

}  // namespace vlm::hints
