// vlmctl: the administrator's view of smart cards on this machine.

#include <iostream>
#include <string>
#include <vector>

#include "services/vlmctl/commands.h"

int main(int argc, char* argv[]) {
    vlm::control::Output output(std::cout, std::cerr);
    const std::vector<std::string> words(argv + (argc > 0 ? 1 : 0), argv + argc);
    return vlm::control::runCommandLine(words, output);
}
