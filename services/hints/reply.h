// The shapes of replies.

#pragma once

#include <cstdint>

#include "platform/message.h"
#include "platform/property_list.h"
#include "services/hints/outcome.h"

namespace vlm::service {

// "res" is the number.
platform::Message numberReply(std::int64_t number);

// "res" is the value as a binary property list.
Outcome<platform::Message> listReply(const platform::PropertyList& value);

// "res" is a list with one entry, "ctx": the record as a binary property list of its own.
Outcome<platform::Message> tokenInfoReply(const platform::PropertyList& record);

// "res" is the refusal's status, and the error entry holds it with its text.
platform::Message refusalReply(const Refusal& refusal);

}  // namespace vlm::service
