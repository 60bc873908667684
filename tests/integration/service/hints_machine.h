// HintsMachine: a machine of a test's own with buses, software cards and the real hints service.
//
// Threads: one. Errors: a part that does not come up fails the running test.

#pragma once

#include <sys/types.h>

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "tests/integration/linux/child.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/temporary_folder.h"
#include "tests/tools/soft_card/soft_cards.h"

namespace vlm::test {

inline constexpr const char* kDaemon = "org.vlm.token.hints.daemon";
inline constexpr const char* kAgent = "org.vlm.token.hints.agent";

// Users that are there on every machine and have no rights.
inline constexpr uid_t kNobodyUser = 65534;
inline constexpr uid_t kOtherUser = 1;

class HintsMachine {
public:
    HintsMachine();

    // One card, "Card", with one identity; its public-key hash in hexadecimal and its identifier.
    void insertCard(const std::string& name = "Alice Example");
    const std::string& hash() const { return _hash; }
    const std::string& token() const { return _token; }
    void removeCard() { _cards.remove("Card"); }
    SoftCards& cards() { return _cards; }

    // Starts an instance and waits until it has its name.
    void startDaemon(std::vector<std::string> moreArguments = {});
    void startAgent(std::optional<uid_t> user, std::vector<std::string> moreArguments = {});
    std::vector<std::string> daemonCommand(std::vector<std::string> moreArguments = {}) const;
    Child& daemon() { return *_daemon; }
    Child& agent() { return *_agent; }
    void stopDaemon() { _daemon.reset(); }

    // From now on the bus starts the daemon when somebody asks for it.
    void makeDaemonStartable(const std::vector<std::string>& moreArguments = {});
    // Its connection to the bus, another one for each start; empty when it does not run.
    std::string daemonConnection() const { return _systemBus.ownerOf(kDaemon); }

    // One exchange. As another user, when one is given; root only can do that.
    std::vector<std::string> callCommand(const std::string& name,
                                         const std::vector<std::string>& arguments) const;
    std::string call(const std::vector<std::string>& arguments,
                     std::optional<uid_t> user = std::nullopt) const;
    std::string callAgent(const std::vector<std::string>& arguments,
                          std::optional<uid_t> user = std::nullopt) const;
    std::vector<std::string> login(const std::vector<std::string>& more = {}) const;
    std::vector<std::string> pair(const std::string& account) const;

    // A program that asks for PINs: a shell script, with what the test wants it to do.
    std::string pinentry(const std::string& script) const;
    // One that gives the PIN.
    std::string answeringPinentry() const;

    Child::Options options(std::optional<uid_t> user = std::nullopt) const;
    PrivateBus& systemBus() { return _systemBus; }
    PrivateBus& sessionBus() { return _sessionBus; }
    const TemporaryFolder& folder() const { return _folder; }

    // Where any user may write.
    std::filesystem::path commonFolder() const { return _folder.path() / "common"; }

private:
    std::string callOn(const std::string& name, const std::vector<std::string>& arguments,
                       std::optional<uid_t> user) const;
    void waitForName(Child& instance, const PrivateBus& bus, const std::string& name);

    TemporaryFolder _folder;
    PrivateBus _systemBus;
    PrivateBus _sessionBus;
    SoftCards _cards;
    std::string _hash;
    std::string _token;
    bool _isDaemonStartable = false;
    std::unique_ptr<Child> _daemon;
    std::unique_ptr<Child> _agent;
};

}  // namespace vlm::test
