// vlmhintsd: the hints service, as the machine's daemon or as one user's instance.

#include <malloc.h>

#include <cstdlib>
#include <iostream>
#include <string>
#include <vector>

#include "services/hints/closed_process.h"
#include "services/hints/instances.h"
#include "services/hints/options.h"
#include "services/hints/service_loop.h"

namespace {

// The C library keeps what a large message took for the next one, once it has seen some, and
// anybody may send one.
void giveLargeBlocksBack() { mallopt(M_MMAP_THRESHOLD, 128 << 10); }

}  // namespace

int main(int argc, char* argv[]) {
    using namespace vlm::service;
    const auto parsed = parseOptions(std::vector<std::string>(argv + 1, argv + argc));
    if (!parsed.options) {
        (parsed.exitStatus == 0 ? std::cout : std::cerr) << parsed.text;
        return parsed.exitStatus;
    }

    closeToOthers();
    giveLargeBlocksBack();
    ServiceLoop loop;
    if (!loop.get()) {
        std::cerr << "vlmhintsd: the system has no room for an event loop\n";
        return EXIT_FAILURE;
    }
    const auto end = parsed.options->instance == Instance::System
                         ? runSystemInstance(loop, *parsed.options)
                         : runUserInstance(loop, *parsed.options);
    if (end.whyNotStarted.empty()) return end.exitStatus;
    std::cerr << "vlmhintsd: " << end.whyNotStarted << "\n";
    return EXIT_FAILURE;
}
