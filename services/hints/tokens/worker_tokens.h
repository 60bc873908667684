// WorkerTokens: the tokens of all configured card modules, each module in a process of its own.
//
// A listing asks all modules at once and is answered when each has answered or has failed; callers
// that ask while one is under way share it. A token that two modules show is the first one's.
// Modules are looked up once, when this is made.

#pragma once

#include <functional>
#include <list>
#include <memory>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/card_worker.h"
#include "services/hints/tokens/module_registry.h"

namespace vlm::service {

struct WorkerTokensOptions {
    std::string workerProgram;  // path of vlm-token-worker
    ModuleFolders folders = ModuleFolders::ofThisMachine();
    WorkerLimits limits;
    // How old a software module's view of its tokens may be. Modules with readers always look.
    std::chrono::milliseconds lookAgainAfter{1'000};
    std::vector<std::string> environment;  // "NAME=value", for the workers only
};

class WorkerTokens final : public Tokens {
public:
    // The loop must outlive this; answers that are missing at the end of it do not come, and no
    // answer may bring that end about.
    WorkerTokens(sd_event* event, const WorkerTokensOptions& options);

    void list(std::function<void(std::vector<Token>)> answer) override;
    LookAgain lookAgain() const override;
    void prove(ProofRequest request, std::function<void(Proof)> answer) override;

private:
    void startRound();
    void finishRound();
    CardWorker* workerOf(const std::string& tokenIdentifier);

    sd_event* _event;
    WorkerGraveyard _graveyard;
    std::vector<std::unique_ptr<CardWorker>> _workers;  // the most important module's first

    // The round under way: who waits for it, and for how many modules it waits.
    std::vector<std::function<void(std::vector<Token>)>> _askers;
    std::size_t _missing = 0;
    EventSource _soon;
};

}  // namespace vlm::service
