// The dictionaries of AskPin(): the question of the daemon, and the answer of a user's instance.
//
// Question: "card", "identity" and "account" text, "state" the card's PinState as an unsigned
// number. Answer:   "res" 0 and "pin"; or "res" a status and an error entry.
//
// Errors:   a dictionary that is not like this is none.
// In tests: tests/unit/services/prompter_messages_test.cpp

#pragma once

#include <optional>

#include "platform/message.h"
#include "services/hints/pin_prompt.h"

namespace vlm::service {

platform::Message writeQuestion(const PinQuestion& question);
std::optional<PinQuestion> readQuestion(const platform::Message& message);  // without a caller

platform::Message writeAnswer(const PinAnswer& answer);
PinAnswer readAnswer(const platform::Message& message);

}  // namespace vlm::service
