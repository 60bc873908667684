#include <cstdlib>
#include <iostream>

#include "tool/agent.h"
#include "tool/command_line.h"
#include "tool/console.h"
#include "tool/sandbox_entry.h"
#include "util/bind_utils.h"

int main(int argc, char* argv[]) {
    vlm::BindUtils::log().debug("starting");
    if (!vlm::initSandbox()) std::abort();
    if (argc < 2) return vlm::runAgent();
    vlm::Console console(std::cout, std::cerr);
    return vlm::runCommandLine(argc, argv, console);
}
