#include <cstdlib>
#include <iostream>

#include "tool/command_line.h"
#include "tool/console.h"
#include "tool/dialog_control.h"
#include "tool/sandbox_entry.h"
#include "util/bind_utils.h"

int main(int argc, char* argv[]) {
    vlm::BindUtils::log().debug("starting");
    if (!vlm::initSandbox()) std::abort();
    vlm::Console console(std::cout, std::cerr);
    return argc < 2 ? vlm::runAgent(console) : vlm::runCommandLine(argc, argv, console);
}
