// CardTable: two cards that a test inserts and pulls, on buses of its own, with the services that
// tell of them; and what a watcher hears of that.
//
// This process finds the buses in its environment, so there is one table in it.
//
// Threads: one, the main queue's.

#pragma once

#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "fake_hints_service.h"
#include "platform/token_watcher.h"
#include "tests/integration/linux/bus_service.h"
#include "tests/integration/linux/private_bus.h"
#include "tests/integration/linux/token_service.h"

namespace vlm::test {

class CardTable {
public:
    // The names of the identities on them.
    static inline const std::string kAlice = "Alice";
    static inline const std::string kBob = "Bob";

    CardTable();
    ~CardTable();
    CardTable(const CardTable&) = delete;
    CardTable& operator=(const CardTable&) = delete;

    void insert(const std::string& identity);
    void pull(const std::string& identity);
    const std::set<std::string>& inserted() const { return _inserted; }

    // "+Alice" and "-Alice", as they were done, and as a watcher was told.
    const std::vector<std::string>& done() const { return _done; }
    std::vector<std::string> told();

private:
    static PrivateBus::Options sessionBus();
    platform::Message answer(const platform::Message& request);
    void hear(const std::string& change);
    void watch();

    std::set<std::string> _inserted;
    std::vector<std::string> _done;

    std::mutex _mutex;  // for these two
    fakes::FakeHintsService _cards;
    std::vector<std::string> _told;

    PrivateBus _machine;
    PrivateBus _session{sessionBus()};
    std::unique_ptr<BusService> _daemon;
    std::unique_ptr<TokenService> _tokens;
    std::shared_ptr<platform::TokenWatcher> _watcher;
};

}  // namespace vlm::test
