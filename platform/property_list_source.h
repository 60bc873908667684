// The text that a property list of a text format came in as.
//
// Shapes: UTF-8, or UTF-16 behind a byte-order mark; a mark is not part of the text. Offsets count
//         bytes of the UTF-8 form, whatever the data was.
// Owns:   what it had to convert; else it refers to the data, which must outlive it.
// Errors: data that is neither has a text that ends where it stops being one.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace vlm::platform {

// False for what nobody can have typed, a zero byte for one. XML knows no such character, not even
// as a reference.
bool isTextCharacter(char32_t character);

class PropertyListSource {
public:
    explicit PropertyListSource(std::span<const std::uint8_t> data);

    std::string_view text() const { return _isConverted ? _converted : _original; }

    // Whether all of the data is text, and a sentence that says why not.
    bool isWhole() const { return _problem.empty(); }
    const std::string& problem() const { return _problem; }

    // Counted from 1; a column is a character.
    struct Place {
        std::size_t line = 1;
        std::size_t column = 1;
    };
    Place placeOf(std::size_t offset) const;

private:
    void convert(std::span<const std::uint8_t> units, bool isBigEndian);
    void cutWhereItIsNoText();

    std::string_view _original;
    std::string _converted;
    bool _isConverted = false;
    std::string _problem;
};

}  // namespace vlm::platform
