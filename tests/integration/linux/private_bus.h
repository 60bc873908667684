// PrivateBus: a message bus of a test's own, a real dbus-daemon that ends with the object.
//
// Hand its address to the code under test as DBUS_SYSTEM_BUS_ADDRESS or DBUS_SESSION_BUS_ADDRESS.
//
// Threads: one at a time. Errors: the constructor throws when there is no bus within the time.

#pragma once

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::test {

class PrivateBus {
public:
    struct Options {
        std::string type = "system";
        bool permissive = true;  // anyone may own any name and send anything
        std::vector<std::filesystem::path> serviceFolders;  // of activation files
        std::vector<std::filesystem::path> includes;        // further configuration files
    };

    PrivateBus() : PrivateBus(Options()) {}
    explicit PrivateBus(const Options& options);

    // A system bus that allows no more than the policy file says.
    static Options underPolicy(const std::filesystem::path& policyFile);

    const std::string& address() const { return _address; }

    bool hasOwner(const std::string& name) const { return !ownerOf(name).empty(); }

    // The unique name of the connection that has the name; empty when none has.
    std::string ownerOf(const std::string& name) const;

    // The bus goes away, as after a crash.
    void stop() { _daemon.reset(); }

    // And is back under the same address, without a connection to it.
    void restart();

private:
    void start();

    TemporaryFolder _folder;
    std::unique_ptr<Child> _daemon;
    std::string _address;
};

}  // namespace vlm::test
