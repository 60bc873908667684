#include "attempts.h"

#include <stdexcept>

namespace vlm::test {

int attempt(Arguments arguments) {
    for (auto* known : {&attemptOnFiles, &attemptPrograms, &attemptCalls})
        if (const int error = known(arguments[0], arguments.subspan(1)); error >= 0) return error;
    throw std::invalid_argument("unknown attempt: " + arguments[0]);
}

}  // namespace vlm::test
