// The tool, taken over: confines itself with the tool's own code, by the profile that is installed
// with it, and then tries one thing that it must not be able to do.
//
//     vlmbind-intruder ATTEMPT [ARGUMENT...]
//
// Prints the error that the attempt met with, "Success" when there was none.

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <iostream>
#include <string>
#include <vector>

#include "attempts.h"
#include "tool/sandbox_entry.h"

int main(int argc, char* argv[]) {
    // An attempt reads no further than its third argument.
    std::vector<std::string> arguments(argv + 1, argv + argc);
    arguments.resize(std::max<std::size_t>(arguments.size(), 4));
    if (!vlm::initSandbox()) return EXIT_FAILURE;
    try {
        std::cout << std::strerror(vlm::test::attempt(arguments)) << std::endl;
    } catch (const std::exception& error) {
        std::cerr << "vlmbind-intruder: " << error.what() << std::endl;
        return EXIT_FAILURE;
    }
}
