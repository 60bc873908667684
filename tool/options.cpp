#include "tool/options.h"

#include <unistd.h>

namespace vlm {

namespace {

// The plus sign makes the C library's parser stop at the first argument that is no option, as
// POSIX has it; otherwise it would go on and look for options behind that argument.
constexpr const char* kOptions = "+iprvfu:h:s:";

}  // namespace

OptionReader::OptionReader(int argc, char* argv[]) : _argc(argc), _argv(argv) {
    // Zero and not one: only zero makes the parser forget where it is within an argument.
    optind = 0;
}

std::optional<Option> OptionReader::next() {
    optarg = nullptr;
    const int letter = getopt(_argc, _argv, kOptions);
    if (letter == -1) return std::nullopt;
    return Option{static_cast<char>(letter), optarg ? optarg : ""};
}

}  // namespace vlm
