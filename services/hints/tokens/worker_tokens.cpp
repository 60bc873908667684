#include "services/hints/tokens/worker_tokens.h"

#include <algorithm>
#include <utility>

#include "platform/harmless_text.h"

namespace vlm::service {

WorkerTokens::WorkerTokens(sd_event* event, const WorkerTokensOptions& options)
    : _event(event), _graveyard(event) {
    for (const ConfiguredModule& module : configuredModules(options.folders)) {
        WorkerCommand command;
        command.arguments = {options.workerProgram, std::to_string(options.lookAgainAfter.count()),
                             module.path};
        command.environment = options.environment;
        _workers.push_back(std::make_unique<CardWorker>(event, _graveyard,
                                                        platform::harmlessText(module.name),
                                                        std::move(command), options.limits));
    }
}

void WorkerTokens::list(std::function<void(std::vector<Token>)> answer) {
    _askers.push_back(std::move(answer));
    if (_askers.size() == 1) startRound();
}

void WorkerTokens::startRound() {
    _missing = _workers.size();
    if (_missing == 0) _soon = callSoon(_event, [this] { finishRound(); });
    for (const auto& worker : _workers)
        worker->list([this](const std::vector<Token>&) {
            if (--_missing == 0) finishRound();
        });
}

void WorkerTokens::finishRound() {
    std::vector<Token> tokens;
    for (const auto& worker : _workers)
        tokens.insert(tokens.end(), worker->lastTokens().begin(), worker->lastTokens().end());
    // The sort keeps a more important module's token before another module's same one.
    std::ranges::stable_sort(tokens, {}, &Token::identifier);
    const auto twice =
        std::unique(tokens.begin(), tokens.end(),
                    [](const Token& a, const Token& b) { return a.identifier == b.identifier; });
    tokens.erase(twice, tokens.end());

    // An asker may ask again at once; that is a new round.
    const auto askers = std::exchange(_askers, {});
    for (const auto& asker : askers) asker(tokens);
}

// What is soonest for one of the modules.
LookAgain WorkerTokens::lookAgain() const {
    auto soonest = LookAgain::OnCardEvent;
    for (const auto& worker : _workers) soonest = std::max(soonest, worker->lookAgain());
    return soonest;
}

CardWorker* WorkerTokens::workerOf(const std::string& tokenIdentifier) {
    const auto worker = std::ranges::find_if(_workers, [&tokenIdentifier](const auto& each) {
        return std::ranges::count(each->lastTokens(), tokenIdentifier, &Token::identifier) > 0;
    });
    return worker == _workers.end() ? nullptr : worker->get();
}

void WorkerTokens::prove(ProofRequest request, std::function<void(Proof)> answer) {
    if (CardWorker* worker = workerOf(request.tokenIdentifier)) {
        worker->prove(std::move(request), std::move(answer));
        return;
    }
    // Perhaps it has just come in. Functions that are kept must be able to be copied, so the
    // request, which cannot, is shared.
    auto shared = std::make_shared<ProofRequest>(std::move(request));
    list([this, shared, answer = std::move(answer)](const std::vector<Token>&) {
        if (CardWorker* worker = workerOf(shared->tokenIdentifier))
            worker->prove(std::move(*shared), answer);
        else
            answer({Proof::Outcome::NoSuchToken, {}, PinState::Ready, "the card is not inserted"});
    });
}

}  // namespace vlm::service
