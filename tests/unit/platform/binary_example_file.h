// The examples of binary property lists that lie in data/binary_property_lists.txt, which says at
// its top how they are written down.
//
// Errors: an example that is not written as it should be throws std::runtime_error with its line.

#pragma once

#include <istream>
#include <optional>
#include <string>
#include <vector>

#include "platform/property_list.h"

namespace vlm::platform {

enum class ExampleForm {
    Canonical,  // what the writer makes of the value
    Readable,   // another form of it that readers take
    Malformed,
};

struct BinaryExample {
    std::string name;
    std::string why;
    ExampleForm form = ExampleForm::Malformed;
    Bytes bytes;
    std::optional<PropertyList> value;  // none of a malformed one
};

std::vector<BinaryExample> readBinaryExamples(std::istream& file);

// The value that a notation stands for; none when it is not one.
std::optional<PropertyList> exampleValue(std::string_view notation);

// Adds the bytes of a token: hexadecimal digits, "*" and how often, or two numbers with ".."
// between and "+" how far apart the numbers from the one to the other are. False for another.
bool appendToken(Bytes& bytes, std::string_view token);

}  // namespace vlm::platform
