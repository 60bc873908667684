// A hints service among fakes: a root and two users, and cards that the test inserts.

#pragma once

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "cards.h"
#include "fake_authority.h"
#include "fake_caller_sessions.h"
#include "fake_caller_watch.h"
#include "fake_pairing_store.h"
#include "fake_pin_prompt.h"
#include "fake_tokens.h"
#include "fake_user_keyrings.h"
#include "platform/property_list.h"
#include "platform/token_framework.h"
#include "platform_test.h"
#include "services/hints/hints_service.h"
#include "services/hints/status.h"
#include "tests/integration/linux/temporary_folder.h"

namespace vlm::service {

class HintsServiceTest : public fakes::PlatformTest {
protected:
    HintsServiceTest() {
        accounts().add("root", 0);
        accounts().add("alice", 1000);
        accounts().add("bob", 1001);
    }

    static Caller root() { return {0, 10, ":1.10"}; }
    static Caller alice() { return {1000, 20, ":1.20"}; }

    // The reply to a request, once the cards have answered; none when there is none yet.
    std::optional<platform::Message> ask(const Caller& caller, const IncomingRequest& request) {
        send(caller, request);
        settle();
        return lastReply();
    }
    void send(const Caller& caller, const IncomingRequest& request) {
        _replies.clear();
        service.handle(caller, request,
                       [this](platform::Message reply) { _replies.push_back(std::move(reply)); });
    }
    // Lets machines answer; people do so when the test says it.
    void settle() {
        sessions.settle();
        tokens.settle();
    }
    std::optional<platform::Message> lastReply() const {
        EXPECT_LE(_replies.size(), 1u) << "a request is answered once";
        return _replies.empty() ? std::nullopt : std::optional(_replies.front());
    }

    static IncomingRequest login(std::uint8_t key, const std::string& token = "pkcs11:token=a") {
        return requestOf(0, {{"dat1", hashOf(key)}, {"str1", token}, {"uid", signedNumber(-1)}});
    }
    static IncomingRequest loginWithPin(std::uint8_t key, const std::string& pin) {
        auto request = login(key);
        request.message.set("str2", pin);
        return request;
    }
    static IncomingRequest pair(const std::string& account, std::uint8_t key) {
        return requestOf(2, {{"dat1", hashOf(key)}, {"str1", account}});
    }
    static IncomingRequest unpair(const std::string& account, std::uint8_t key) {
        return requestOf(3, {{"dat1", hashOf(key)}, {"str1", account}});
    }

    static std::optional<std::int64_t> result(const std::optional<platform::Message>& reply) {
        return reply ? reply->integer("res") : std::nullopt;
    }
    // The sentence of a refusal.
    static std::string errorText(const std::optional<platform::Message>& reply) {
        std::optional<platform::Error> error;
        if (!reply || platform::decodeReplyError(*reply, &error) || !error) return "(no error)";
        EXPECT_EQ(error->code, reply->integer("res")) << "the error and the result differ";
        return error->description();
    }
    static platform::PropertyList list(const std::optional<platform::Message>& reply) {
        const auto* bytes = reply ? reply->bytes("res") : nullptr;
        const auto value = bytes ? platform::readPropertyList(*bytes) : std::nullopt;
        return value.value_or("(no list)");
    }

    std::int64_t now = 0;  // milliseconds

    fakes::FakeTokens tokens;
    fakes::FakePinPrompt prompt;
    fakes::FakePairingStore pairings;
    fakes::FakeCallerWatch callers;
    fakes::FakeCallerSessions sessions;
    fakes::FakeAuthority authority;
    fakes::FakeUserKeyrings keyrings;
    Proofs proofs{[this] { return now; }};
    AdministratorRight right{authority};
    test::TemporaryFolder folder;
    SessionCards sessionCards{folder.path() / "vlm" / "sessions"};
    std::set<std::string> openSessions;
    SessionLogin sessionLogin{sessionCards,
                              [this](const auto& name) { return openSessions.contains(name); }};
    std::uint8_t lastRandom = 0;
    HintsService service{{
        .login = {
            tokens, prompt,
            [](const Bytes&, const Bytes& hash, const Bytes& challenge, const Bytes& signature) {
                return signature == fakes::FakeTokens::signature(hash, challenge);
            },
            [this](std::size_t size) { return std::optional(Bytes(size, ++lastRandom)); }},
        .changes = {tokens, pairings, proofs, sessions, right, [] { return kNow; }},
        .unlockKeys = {tokens, pairings, pairings, keyrings},
        .sessionLogin = sessionLogin,
        .callers = callers,
    }};

private:
    std::vector<platform::Message> _replies;
};

}  // namespace vlm::service
