#pragma once

#include <algorithm>
#include <deque>
#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "services/hints/tokens.h"

namespace vlm::fakes {

// Cards with one PIN each, in a reader that answers when the test lets it. A card's "signature" is
// the key's hash followed by the challenge.
class FakeTokens final : public service::Tokens {
public:
    static constexpr int kTries = 3;

    // What a test does to the world.
    void insert(service::Token token, const std::string& pin = "123456") {
        _pins[token.identifier] = {pin, kTries};
        _tokens.push_back(std::move(token));
        std::ranges::sort(_tokens, {}, &service::Token::identifier);
    }
    void pull(const std::string& identifier) {
        std::erase_if(_tokens, [&](const auto& token) { return token.identifier == identifier; });
    }
    void failProofs(service::Proof::Outcome outcome, const std::string& reason = "") {
        _failure = outcome;
        _reason = reason;
    }
    void announceNothing() { _lookAgain = service::LookAgain::NowAndThen; }
    void signWithAnotherKey() { _signsWrongly = true; }

    // Lets the cards answer everything that was asked of them, also in the course of it.
    void settle() {
        while (!_due.empty()) answerOne();
    }
    void answerOne() {
        const auto next = std::move(_due.front());
        _due.pop_front();
        next();
    }

    // What a wrap key makes of what it is to open; none when it fails.
    std::function<std::optional<service::Secret>(const service::OpenRequest&)> open;

    // What happened.
    int listings = 0;
    std::vector<std::string> pinsTried;
    std::vector<service::Bytes> challenges;

    static service::Bytes signature(const service::Bytes& hash, const service::Bytes& challenge) {
        auto signature = hash;
        signature.insert(signature.end(), challenge.begin(), challenge.end());
        return signature;
    }

    // Tokens:
    void list(std::function<void(std::vector<service::Token>)> answer) override {
        ++listings;
        _due.emplace_back([this, answer = std::move(answer)] { answer(_tokens); });
    }
    service::LookAgain lookAgain() const override { return _lookAgain; }
    void prove(service::ProofRequest request, std::function<void(service::Proof)> answer) override {
        pinsTried.emplace_back(request.pin.text());
        challenges.push_back(request.challenge);
        const auto proof = proofFor(request);
        _due.emplace_back([proof, answer = std::move(answer)] { answer(proof); });
    }

private:
    struct Pin {
        std::string text;
        int triesLeft = kTries;
    };

    service::Proof proofFor(const service::ProofRequest& request) {
        using Outcome = service::Proof::Outcome;
        service::Proof proof;
        proof.outcome = _failure.value_or(judge(request));
        proof.reason = _reason;
        proof.pinStateAfter = stateOf(_pins[request.tokenIdentifier]);
        if (proof.outcome != Outcome::Signed) return proof;
        proof.signature = signature(request.publicKeyHash, request.challenge);
        if (_signsWrongly) proof.signature[0] ^= 1U;
        if (request.open) letOpen(*request.open, proof);
        return proof;
    }

    void letOpen(const service::OpenRequest& request, service::Proof& proof) {
        auto opened = open ? open(request) : std::nullopt;
        if (opened)
            proof.opened = std::make_shared<const service::Secret>(std::move(*opened));
        else
            proof.whyNotOpened = "the wrap key is gone";
    }

    service::Proof::Outcome judge(const service::ProofRequest& request) {
        using Outcome = service::Proof::Outcome;
        const auto token =
            std::ranges::find(_tokens, request.tokenIdentifier, &service::Token::identifier);
        if (token == _tokens.end()) return Outcome::NoSuchToken;
        if (std::ranges::find(token->identities, request.publicKeyHash,
                              &service::Identity::publicKeyHash) == token->identities.end())
            return Outcome::NoSuchKey;
        const bool asksItself = token->hasPinPad && request.pin.empty();
        if (!token->needsLogin || asksItself) return Outcome::Signed;
        auto& pin = _pins[token->identifier];
        if (pin.triesLeft == 0) return Outcome::PinLocked;
        const bool isRight = request.pin.text() == pin.text;
        pin.triesLeft = isRight ? kTries : pin.triesLeft - 1;
        token->pinState = stateOf(pin);
        return isRight ? Outcome::Signed : Outcome::PinIncorrect;
    }

    static service::PinState stateOf(const Pin& pin) {
        if (pin.triesLeft == 0) return service::PinState::Locked;
        if (pin.triesLeft == 1) return service::PinState::LastTry;
        return pin.triesLeft < kTries ? service::PinState::FewTriesLeft : service::PinState::Ready;
    }

    std::vector<service::Token> _tokens;
    std::map<std::string, Pin> _pins;
    std::deque<std::function<void()>> _due;
    std::optional<service::Proof::Outcome> _failure;
    std::string _reason;
    bool _signsWrongly = false;
    service::LookAgain _lookAgain = service::LookAgain::OnCardEvent;
};

}  // namespace vlm::fakes
