// Message: the keyed dictionary in which a service and its clients talk.
//
// Shapes:   entries keep the order in which their keys were set; keys are short ASCII. A value is
//           an unsigned or signed 64-bit integer, UTF-8 text, bytes, or an endpoint.
// Threads:  a value; distinct values are independent.
// Errors:   reading a key that is absent, or holds another type, answers none.
// Secrets:  text and bytes are overwritten before their memory is given back, since a PIN may
//           travel in a message.
// In tests: tests/unit/platform/message_test.cpp

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "platform/endpoint.h"
#include "platform/types.h"

namespace vlm::platform {

class Message {
public:
    using Value = std::variant<std::uint64_t, std::int64_t, std::string, Bytes, Endpoint>;
    using Entry = std::pair<std::string, Value>;

    Message() = default;
    Message(Message&&) noexcept = default;
    Message& operator=(Message&&) noexcept;
    Message(const Message&) = default;
    Message& operator=(const Message&);
    ~Message();

    // Sets the key's value, in its place when the key is there already.
    void set(std::string_view key, Value value);

    std::optional<std::uint64_t> unsignedInteger(std::string_view key) const;
    std::optional<std::int64_t> integer(std::string_view key) const;
    const std::string* text(std::string_view key) const;  // null when absent; valid until a change
    const Bytes* bytes(std::string_view key) const;       // likewise
    std::optional<Endpoint> endpoint(std::string_view key) const;

    bool contains(std::string_view key) const { return find(key) != nullptr; }
    const std::vector<Entry>& entries() const { return _entries; }

    bool operator==(const Message&) const = default;

private:
    const Value* find(std::string_view key) const;
    void makeRoom();
    void wipe();

    std::vector<Entry> _entries;
};

}  // namespace vlm::platform
