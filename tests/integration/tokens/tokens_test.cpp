#include "tests/integration/tokens/tokens_test.h"

#include <sys/stat.h>
#include <sys/wait.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <fstream>

namespace vlm::test {
namespace {

using namespace std::chrono_literals;

template <typename Named>
std::vector<std::string> sortedNames(const std::vector<Named>& all) {
    std::vector<std::string> names;
    for (const Named& each : all) names.push_back(each.name);
    std::ranges::sort(names);
    return names;
}

}  // namespace

TokensTest::TokensTest() {
    sd_event* event = nullptr;
    EXPECT_GE(sd_event_new(&event), 0);
    _event.reset(event);
    options.workerProgram = VLM_TOKEN_WORKER;
    options.folders = {cards.moduleDirectory(), cards.folder() / "admin", cards.folder()};
    for (const auto& [name, value] : cards.environment())
        options.environment.push_back(name + "=" + value.value());
    options.lookAgainAfter = 0ms;
    options.limits.list = 30s;  // of no interest to most tests, and sanitizers are slow
}

TokensTest::~TokensTest() {
    dropTokens();
    if (!_script.empty()) std::filesystem::remove_all(_script.parent_path());
    EXPECT_TRUE(waitpid(-1, nullptr, WNOHANG) == -1 && errno == ECHILD) << "a process is left";
}

service::WorkerTokens& TokensTest::tokens() {
    if (!_tokens) _tokens = std::make_unique<service::WorkerTokens>(_event.get(), options);
    return *_tokens;
}

void TokensTest::dropTokens() { _tokens.reset(); }

void TokensTest::runUntil(const std::function<bool()>& done) {
    const auto end = std::chrono::steady_clock::now() + 50s;
    while (!done() && std::chrono::steady_clock::now() < end)
        ASSERT_GE(sd_event_run(_event.get(), 1'000'000), 0);
    ASSERT_TRUE(done()) << "no answer came";
}

std::vector<Token> TokensTest::list() {
    std::optional<std::vector<Token>> answer;
    tokens().list([&answer](std::vector<Token> all) { answer = std::move(all); });
    EXPECT_FALSE(answer) << "answered before the call returned";
    runUntil([&answer] { return answer.has_value(); });
    return answer.value_or(std::vector<Token>{});
}

Proof TokensTest::prove(const Token& token, const Identity& identity, const std::string& pin) {
    service::ProofRequest request;
    request.tokenIdentifier = token.identifier;
    request.publicKeyHash = identity.publicKeyHash;
    request.challenge = platform::Bytes(32, 0x5A);
    request.pin = service::Secret(pin);
    return proveWith(std::move(request));
}

Proof TokensTest::proveWith(service::ProofRequest request) {
    std::optional<Proof> answer;
    tokens().prove(std::move(request), [&answer](Proof proof) { answer = std::move(proof); });
    EXPECT_FALSE(answer) << "answered before the call returned";
    runUntil([&answer] { return answer.has_value(); });
    return answer.value_or(Proof{});
}

Token TokensTest::tokenCalled(const std::string& name) {
    const auto all = list();
    const auto found = std::ranges::find(all, name, &Token::name);
    EXPECT_NE(found, all.end()) << "no token is called " << name;
    return found == all.end() ? Token{} : *found;
}

void TokensTest::configureModule(const std::string& name) {
    cards.configureModule(name, "module: " VLM_TEST_MODULES "/" + name + "_module.so\n");
}

// Folders in memory may not hold programs, so it does not lie with the cards.
void TokensTest::useWorkerScript(const std::string& commands) {
    std::string folder = std::filesystem::temp_directory_path() / "vlm-worker-XXXXXX";
    ASSERT_NE(mkdtemp(folder.data()), nullptr);
    _script = std::filesystem::path(folder) / "worker";
    std::ofstream(_script) << "#!/bin/sh\n" << commands << "\n";
    chmod(_script.c_str(), 0700);
    options.workerProgram = _script;
}

void TokensTest::configureOnly(const std::string& name) {
    cards.configureModule("softhsm", "module:\n");
    configureModule(name);
}

std::vector<std::string> namesOf(const std::vector<Identity>& identities) {
    return sortedNames(identities);
}
std::vector<std::string> namesOf(const std::vector<Token>& tokens) { return sortedNames(tokens); }

}  // namespace vlm::test
