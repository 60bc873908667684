// HintsTest: an ordinary process of a user who sits at the console, and one-line forms of what goes
// over the wire, into the log and back to the caller, so that tables can name them.

#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "platform/message.h"
#include "platform/property_list.h"
#include "platform/string.h"
#include "platform/token_framework.h"
#include "platform_test.h"

namespace vlm::hints {

using platform::Bytes;
using platform::Endpoint;
using platform::Error;
using platform::LogLevel;
using platform::Message;
using platform::PropertyList;
using platform::ServiceScope;
using platform::Status;
using platform::String;
using platform::UserId;

inline const Bytes kHash = {0xAB, 0x01};

// Stored as UTF-16, and as long in UTF-8 as its conversion has room for.
String unsendable();

// Replies: with a result, and with an error besides what is there.
Message replyWith(std::int64_t result);
Message replyWith(std::uint64_t result);
Message replyWith(Bytes result);
Message failed(Message reply = {});
Error refusal();  // that error

// What a function answered.
std::string shown(bool answer);
std::string shown(Status status);
std::string shown(const std::optional<PropertyList>& list);
std::string shown(const std::optional<PropertyList::Array>& array);

// A message's entries in their order; an unsigned number ends in "u".
std::string shown(const Message& message);

class HintsTest : public fakes::PlatformTest {
protected:
    HintsTest();

    void serve(const Message& reply);
    std::string lastRequest();

    // The log so far, each line behind its level.
    std::vector<std::string> logged();
};

}  // namespace vlm::hints
