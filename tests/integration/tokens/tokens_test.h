// TokensTest: software cards, the real workers, and the loop that they answer on.

#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "platform_test.h"
#include "services/hints/tokens/worker_tokens.h"
#include "tests/tools/soft_card/soft_cards.h"

namespace vlm::test {

using service::Identity;
using service::PinState;
using service::Proof;
using service::Token;

struct EventUnref {
    void operator()(sd_event* event) const { sd_event_unref(event); }
};

class TokensTest : public fakes::PlatformTest {
protected:
    TokensTest();
    ~TokensTest() override;

    // How the tokens are made when they are first used.
    service::WorkerTokensOptions options;

    service::WorkerTokens& tokens();
    void dropTokens();  // with their workers

    // Answers, waited for on the loop; a test that waits too long fails.
    std::vector<Token> list();
    Proof prove(const Token& token, const Identity& identity, const std::string& pin);
    Proof proveWith(service::ProofRequest request);
    void runUntil(const std::function<bool()>& done);

    // The tokens under their names; each test uses names once where it looks them up.
    Token tokenCalled(const std::string& name);

    // Configures one of the modules with a fault, and makes its own cards hide behind it.
    void configureModule(const std::string& name);
    void configureOnly(const std::string& name);

    // A worker program that is a shell script; what it is asked comes on descriptor 3.
    void useWorkerScript(const std::string& commands);

    std::vector<std::string> warnings() { return log().texts(platform::LogLevel::Error); }

    sd_event* event() { return _event.get(); }
    SoftCards cards;

private:
    std::unique_ptr<sd_event, EventUnref> _event;
    std::unique_ptr<service::WorkerTokens> _tokens;
    std::filesystem::path _script;
};

std::vector<std::string> namesOf(const std::vector<Identity>& identities);
std::vector<std::string> namesOf(const std::vector<Token>& tokens);

}  // namespace vlm::test
