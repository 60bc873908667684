// Prints which tokens come and go, as the upper floors are told: "+ TOKEN", "- TOKEN". Ends with
// its standard input.

#include <iostream>
#include <limits>
#include <string>

#include "platform/platform.h"
#include "platform/token_watcher.h"

int main() {
    const auto watcher = vlm::platform::current().tokenFramework().watchTokens();
    watcher->setInsertionHandler([&watcher = *watcher](const std::string& token) {
        std::cout << "+ " << token << std::endl;
        watcher.addRemovalHandler(
            token, [](const std::string& gone) { std::cout << "- " << gone << std::endl; });
    });
    std::cin.ignore(std::numeric_limits<std::streamsize>::max());
}
