// vlmhintsd: the hints service, as the machine's daemon or as one user's instance.

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "services/hints/instances.h"
#include "services/hints/options.h"
#include "services/hints/service_loop.h"

int main(int argc, char* argv[]) {
    using namespace vlm::service;
    const auto parsed = parseOptions(std::vector<std::string>(argv + 1, argv + argc));
    if (!parsed.options) {
        std::fputs(parsed.text.c_str(), parsed.exitStatus == 0 ? stdout : stderr);
        return parsed.exitStatus;
    }

    ServiceLoop loop;
    if (!loop.get()) {
        std::fputs("vlmhintsd: the system has no room for an event loop\n", stderr);
        return EXIT_FAILURE;
    }
    const auto end = parsed.options->instance == Instance::System
                         ? runSystemInstance(loop, *parsed.options)
                         : runUserInstance(loop, *parsed.options);
    if (end.whyNotStarted.empty()) return end.exitStatus;
    std::fprintf(stderr, "vlmhintsd: %s\n", end.whyNotStarted.c_str());
    return EXIT_FAILURE;
}
