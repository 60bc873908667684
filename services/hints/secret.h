// Secret: a PIN, a password or a key on its way.
//
// The text lives in memory of its own that is locked (never swapped), left out of core files and
// wiped when the secret is destroyed or moved from. It is never logged and never converted to text.
//
// Threads: a value with one owner; it moves and does not copy.
// Errors:  memory that cannot be locked is used all the same; it is still wiped.

#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

namespace vlm::service {

class Secret {
public:
    Secret() = default;
    explicit Secret(std::string_view text);

    // A secret of that many zero bytes, to be filled in through memory().
    static Secret ofSize(std::size_t size);

    Secret(Secret&& other) noexcept;
    Secret& operator=(Secret&& other) noexcept;
    Secret(const Secret&) = delete;
    Secret& operator=(const Secret&) = delete;
    ~Secret();

    // Valid as long as the secret is.
    std::string_view text() const { return {_text, _size}; }
    std::span<char> memory() { return {_text, _size}; }
    std::span<std::uint8_t> octets() { return {reinterpret_cast<std::uint8_t*>(_text), _size}; }
    std::span<const std::uint8_t> octets() const {
        return {reinterpret_cast<const std::uint8_t*>(_text), _size};
    }
    bool empty() const { return _size == 0; }

    // Forgets what stands behind the first `size` bytes.
    void shorten(std::size_t size);

private:
    void wipe();

    char* _text = nullptr;
    std::size_t _size = 0;
    std::size_t _capacity = 0;
};

// Overwrites memory in a way that the compiler keeps.
void wipeMemory(std::span<char> memory);

}  // namespace vlm::service
