// Machine: a private system bus under the policy that gets installed, software cards, the real
// hints service and a home folder, for running the real vlmbind against.

#pragma once

#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/temporary_folder.h"
#include "tests/tools/soft_card/soft_cards.h"

namespace vlm::test {

class Machine {
public:
    Machine();

    SoftCards cards;

    // The service, with somebody at its pinentry who types this.
    void startService(const std::string& typedPin = SoftCards::kPin);
    void stopService();

    // The tool, where every user may run it.
    std::filesystem::path tool() const { return _folder.path() / "tree" / "bin" / "vlmbind"; }

    // Runs the tool to its end, as the user that the test runs as or as another; run() the same
    // with a whole command.
    Ended vlmbind(std::vector<std::string> arguments, std::optional<uid_t> user = std::nullopt,
                  Child::Environment environment = {});
    Ended run(std::vector<std::string> command, std::optional<uid_t> user = std::nullopt,
              Child::Environment environment = {});

    // The home folder of that user, made with its first use.
    std::filesystem::path homeOf(std::optional<uid_t> user) const;

    // The listing, once it holds the text, or is empty for an empty one; or the last one after some
    // seconds. The service looks at software cards for news once a second.
    std::string listingOnceItShows(const std::string& text);

    // What the service wrote to its log so far.
    const std::string& serviceLog();

private:
    Child::Environment environment() const;

    TemporaryFolder _folder;
    PrivateBus _bus;
    std::unique_ptr<Child> _service;
};

}  // namespace vlm::test
