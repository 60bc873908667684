// An agent that does what is posted to it, and tells each word when that is done:
//
//     open, close    a transaction
//     read           waits for a line on standard input
//     exit STATUS    ends
//     work           does something on the main queue later, and tells "worked"

#include <cstdlib>
#include <iostream>
#include <memory>
#include <string>

#include "platform/application.h"
#include "platform/platform.h"
#include "platform/work_queues.h"

int main() {
    auto& application = vlm::platform::current().application();
    std::unique_ptr<vlm::platform::Application::Transaction> transaction;

    application.setEventHandler([&](const std::string& word) {
        std::string line;
        if (word == "open") transaction = application.openTransaction();
        if (word == "close") transaction.reset();
        if (word == "read") std::getline(std::cin, line);
        if (word == "work")
            vlm::platform::current().workQueues().runInBackground([] {
                vlm::platform::current().workQueues().runOnMain(
                    [] { std::cout << "worked" << std::endl; });
            });
        if (word.starts_with("exit ")) application.exit(std::atoi(word.c_str() + 5));
        std::cout << word << std::endl;
    });
    return application.run();
}
