// Wraps a text for each inserted card that can open one, and has the card open it in a login:
// vlm-open-by-card WORKER PIN prints for each card its name, the scheme's number, and the text or
// why there is none.

#include <algorithm>
#include <iostream>

#include "services/hints/tokens/signature.h"
#include "services/hints/tokens/worker_tokens.h"
#include "services/keychain/unlock_key_wrapping.h"

namespace {

using namespace vlm::service;

const Bytes kChallenge(32, 7);

struct EventUnref {
    void operator()(sd_event* event) const { sd_event_unref(event); }
};
using Event = std::unique_ptr<sd_event, EventUnref>;

// What the asking answers, once it does.
template <typename Answer, typename Ask>
Answer waitFor(sd_event* event, const Ask& ask) {
    std::optional<Answer> answer;
    ask([&answer](Answer given) { answer = std::move(given); });
    while (!answer && sd_event_run(event, UINT64_MAX) >= 0) continue;
    return std::move(*answer);
}

std::string openedBy(sd_event* event, WorkerTokens& tokens, const Token& token,
                     const std::string& pin) {
    const auto wrap = std::ranges::find(token.identities, token.wrapKeyHash.value_or(Bytes{}),
                                        &Identity::publicKeyHash);
    const auto signer = std::ranges::find(token.identities, true, &Identity::canSign);
    if (wrap == token.identities.end() || signer == token.identities.end()) return "no wrap key";
    const UnlockKeyPurpose purpose{"alice", signer->publicKeyHash, wrap->publicKeyHash};
    const auto form =
        wrapUnlockKey(Secret("correct horse"), purpose, wrap->publicKeyInfo, token.wrapScheme);
    if (!form) return "not wrapped";

    const Proof proof = waitFor<Proof>(event, [&](auto answer) {
        ProofRequest request;
        request.tokenIdentifier = token.identifier;
        request.publicKeyHash = signer->publicKeyHash;
        request.challenge = kChallenge;
        request.pin = Secret(pin);
        request.open = cardTask(*form, purpose.wrapKeyHash);
        tokens.prove(std::move(request), answer);
    });
    if (!verifySignature(signer->publicKeyInfo, signer->publicKeyHash, kChallenge, proof.signature))
        return "not signed: " + proof.reason;
    if (!proof.opened) return "not opened: " + proof.whyNotOpened;
    const auto opened = unwrapUnlockKey(*form, *proof.opened, purpose);
    return opened ? std::string(opened->text()) : "opened something else";
}

}  // namespace

int main(int argc, char* argv[]) {
    if (argc != 3) return 2;
    sd_event* loop = nullptr;
    if (sd_event_new(&loop) < 0) return 1;
    const Event event(loop);
    WorkerTokensOptions options;
    options.workerProgram = argv[1];
    WorkerTokens tokens(loop, options);
    const auto all = waitFor<std::vector<Token>>(
        loop, [&tokens](auto answer) { tokens.list(std::move(answer)); });
    for (const Token& token : all)
        std::cout << token.name << '\t' << static_cast<int>(token.wrapScheme) << '\t'
                  << openedBy(loop, tokens, token, argv[2]) << '\n';
}
