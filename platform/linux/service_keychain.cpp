#include "platform/linux/service_keychain.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <string_view>
#include <utility>

#include "platform/accounts.h"
#include "platform/console_sessions.h"
#include "platform/message.h"
#include "platform/named_service_ipc.h"
#include "platform/platform.h"

namespace vlm::platform {

namespace {

constexpr std::string_view kDaemon = "org.vlm.token.hints.daemon";

constexpr std::uint64_t kNameKeyring = 8;
constexpr std::uint64_t kStoreUnlockKey = 9;
constexpr std::uint64_t kEraseUnlockKey = 10;

class NamedKeychain final : public LoginKeychain {
public:
    explicit NamedKeychain(std::string name) : _name(std::move(name)) {}
    const std::string& name() const override { return _name; }

private:
    const std::string _name;
};

Message requestFor(std::uint64_t operation) {
    Message request;
    request.set("op", operation);
    return request;
}

Message ask(const Message& request) {
    const auto connection = current().namedServiceIpc().connect(kDaemon, ServiceScope::Machine);
    connection->resume();
    return connection->sendAndWait(request);
}

Status statusIn(const Message& reply) {
    using Range = std::numeric_limits<Status>;
    const auto number = reply.integer("res");
    if (!number || *number < Range::min() || *number > Range::max()) return kNoKeychainService;
    return static_cast<Status>(*number);
}

}  // namespace

std::optional<UserId> userAtConsole() {
    const auto sessions = current().consoleSessions().sessions();
    if (!sessions) return std::nullopt;
    const auto found = std::ranges::find_if(*sessions, &ConsoleSession::onConsole);
    if (found == sessions->end() || found->userId == 0) return std::nullopt;
    return found->userId;
}

Keychain::Copied ServiceKeychain::copyLoginKeychain() {
    const auto user = _owner();
    if (!user) return {kNobodyAtConsole, nullptr};
    auto request = requestFor(kNameKeyring);
    request.set("uid", std::int64_t{*user});
    const auto reply = ask(request);
    const auto status = statusIn(reply);
    if (status != kSuccess) return {status, nullptr};
    const auto* name = reply.text("str1");
    if (!name) return {kNoKeychainService, nullptr};
    return {kSuccess, std::make_unique<NamedKeychain>(*name)};
}

Status ServiceKeychain::storeUnlockKey(const Bytes& publicKeyHash, const std::string& token,
                                       const Bytes& wrapKeyHash, const LoginKeychain& keychain,
                                       const std::string& text) {
    const auto user = _owner();
    if (!user) return kNobodyAtConsole;
    auto request = requestFor(kStoreUnlockKey);
    request.set("uid", std::int64_t{*user});
    request.set("dat1", publicKeyHash);
    request.set("dat2", wrapKeyHash);
    request.set("str1", token);
    request.set("str2", keychain.name());
    request.set("str3", text);
    return statusIn(ask(request));
}

Status ServiceKeychain::eraseUnlockKey(const Bytes& publicKeyHash) {
    const auto user = _owner();
    const auto account = user ? current().accounts().userName(*user) : std::nullopt;
    if (!account) return kNobodyAtConsole;
    auto request = requestFor(kEraseUnlockKey);
    request.set("str1", *account);
    request.set("dat1", publicKeyHash);
    return statusIn(ask(request));
}

Keychain& Platform::keychain() {
    static auto& service = *new ServiceKeychain;
    return service;
}

}  // namespace vlm::platform
