#include "tests/integration/card_cycles/card_table.h"

#include <cstdlib>

#include "hints/hints_connection.h"
#include "platform/linux/bus_token_watcher.h"
#include "platform/platform.h"
#include "platform/work_queues.h"

namespace vlm::test {

namespace {

std::string tokenOf(const std::string& identity) { return "pkcs11:token=" + identity; }

// The first letter tells the keys of the cards apart.
platform::Bytes hashOf(const std::string& identity, std::uint8_t use) {
    return {static_cast<std::uint8_t>(identity.front()), use};
}

}  // namespace

// Who runs this may sit at a console, and then asks the user's own service.
CardTable::CardTable() {
    ::setenv("DBUS_SYSTEM_BUS_ADDRESS", _machine.address().c_str(), 1);
    ::setenv("DBUS_SESSION_BUS_ADDRESS", _session.address().c_str(), 1);
    ::setenv("VLM_LOG_TARGET", "none", 1);
    const auto answering = [this](const platform::Message& request) { return answer(request); };
    _daemon = std::make_unique<BusService>(_machine.address(), std::string(hints::kDaemonService),
                                           answering);
    _tokens = std::make_unique<TokenService>(_session.address());
    _tokens->answerRequests(answering);
    watch();
}

CardTable::~CardTable() { _watcher.reset(); }

PrivateBus::Options CardTable::sessionBus() {
    PrivateBus::Options options;
    options.type = "session";
    return options;
}

platform::Message CardTable::answer(const platform::Message& request) {
    const std::lock_guard lock(_mutex);
    return _cards.answer(request);
}

void CardTable::insert(const std::string& identity) {
    {
        const std::lock_guard lock(_mutex);
        _cards.insert({tokenOf(identity),
                       identity + "'s card",
                       {{hashOf(identity, 1), identity}},
                       hashOf(identity, 2)});
    }
    _inserted.insert(identity);
    _done.push_back('+' + identity);
    _tokens->insert(tokenOf(identity));
}

void CardTable::pull(const std::string& identity) {
    {
        const std::lock_guard lock(_mutex);
        _cards.remove(tokenOf(identity));
    }
    _inserted.erase(identity);
    _done.push_back('-' + identity);
    _tokens->pull(tokenOf(identity));
}

std::vector<std::string> CardTable::told() {
    const std::lock_guard lock(_mutex);
    return _told;
}

// The loop is woken, so that whoever waits there looks again.
void CardTable::hear(const std::string& change) {
    {
        const std::lock_guard lock(_mutex);
        _told.push_back(change);
    }
    platform::current().workQueues().runOnMain([] {});
}

void CardTable::watch() {
    _watcher = platform::BusTokenFramework().watchTokens();
    _watcher->setInsertionHandler([this](const std::string& token) {
        const auto identity = token.substr(tokenOf("").size());
        hear('+' + identity);
        _watcher->addRemovalHandler(token, [this, identity](const auto&) { hear('-' + identity); });
    });
    _tokens->isAsked();
}

}  // namespace vlm::test
