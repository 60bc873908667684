// What counts as work of the service: a request until it is answered or given up, and all that a
// card does, also for a caller that has left meanwhile.

#pragma once

#include <functional>
#include <utility>
#include <vector>

#include "services/hints/exchanges.h"
#include "services/hints/idleness.h"
#include "services/hints/tokens.h"

namespace vlm::service {

class CountedExchanges final : public Exchanges {
public:
    CountedExchanges(Exchanges& exchanges, Idleness& idleness)
        : _exchanges(exchanges), _idleness(idleness) {}

    void handle(const Caller& caller, const IncomingRequest& request, Reply reply) override {
        _exchanges.handle(caller, request,
                          [work = _idleness.begin(), reply = std::move(reply)](
                              platform::Message message) { reply(std::move(message)); });
    }

private:
    Exchanges& _exchanges;
    Idleness& _idleness;
};

class CountedTokens final : public Tokens {
public:
    CountedTokens(Tokens& tokens, Idleness& idleness) : _tokens(tokens), _idleness(idleness) {}

    void list(std::function<void(std::vector<Token>)> answer) override {
        _tokens.list([work = _idleness.begin(), answer = std::move(answer)](
                         std::vector<Token> tokens) { answer(std::move(tokens)); });
    }
    LookAgain lookAgain() const override { return _tokens.lookAgain(); }
    void prove(ProofRequest request, std::function<void(Proof)> answer) override {
        _tokens.prove(std::move(request), [work = _idleness.begin(), answer = std::move(answer)](
                                              Proof proof) { answer(std::move(proof)); });
    }

private:
    Tokens& _tokens;
    Idleness& _idleness;
};

}  // namespace vlm::service
