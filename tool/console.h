// Console: what the tool says to the person who ran it. Everything said is logged first.
//
// Ownership: the streams are borrowed.
// Threads:   one.
// Errors:    output that is lost, on a full disk for instance, shows when the console is flushed.
// In tests:  tests/unit/tool/console_test.cpp

#pragma once

#include <ostream>
#include <string>

namespace vlm {

class Console {
public:
    Console(std::ostream& output, std::ostream& complaints)
        : _output(output), _complaints(complaints) {}

    // Prints a line, given without the line feed that ends it.
    void print(const std::string& line);

    // Says what cannot be done: an error in the log, a line on standard error.
    void complain(const std::string& line);

    // False when something that was printed did not get out.
    bool flush();

private:
    std::ostream& _output;
    std::ostream& _complaints;
};

}  // namespace vlm
