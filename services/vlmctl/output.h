// Output: what vlmctl says: lines on standard output, complaints on standard error.
//
// Ownership: the streams are borrowed.
// Errors:    output that is lost, on a full disk for instance, shows when it is flushed.
// In tests:  tests/unit/vlmctl/output_test.cpp

#pragma once

#include <ostream>
#include <string_view>

namespace vlm::control {

class Output {
public:
    Output(std::ostream& output, std::ostream& complaints)
        : _output(output), _complaints(complaints) {}

    // Prints a line, given without the line feed that ends it.
    void print(std::string_view line) { _output << line << '\n'; }

    // Says what cannot be done; what the text quotes is made harmless here.
    void complain(std::string_view text);

    // False, with a complaint, when something that was printed did not get out.
    bool flush();

private:
    std::ostream& _output;
    std::ostream& _complaints;
};

}  // namespace vlm::control
