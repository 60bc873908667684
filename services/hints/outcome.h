// Outcome: a value, or the refusal that stands in its place.
//
// Threads: a value. Errors: reading the value of a refused outcome is a mistake of the program.

#pragma once

#include <string>
#include <utility>
#include <variant>

#include "platform/types.h"

namespace vlm::service {

// Why something was not done: a number for programs (status.h) and a sentence for people, which
// says what was attempted, on what, why it was not done, and what to do when there is something.
struct Refusal {
    platform::Status status = 0;
    std::string text;

    bool operator==(const Refusal&) const = default;
};

template <typename Value>
class Outcome {
public:
    Outcome(Value value) : _content(std::move(value)) {}        // NOLINT: either is the outcome
    Outcome(Refusal refusal) : _content(std::move(refusal)) {}  // NOLINT

    explicit operator bool() const { return std::holds_alternative<Value>(_content); }

    Value& operator*() { return std::get<Value>(_content); }
    const Value& operator*() const { return std::get<Value>(_content); }
    Value* operator->() { return &std::get<Value>(_content); }
    const Value* operator->() const { return &std::get<Value>(_content); }

    const Refusal& refusal() const { return std::get<Refusal>(_content); }

private:
    std::variant<Value, Refusal> _content;
};

}  // namespace vlm::service
