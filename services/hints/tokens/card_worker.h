// CardWorker: one card module, in a worker process of its own that is started when it is needed.
//
// The worker serves one request at a time; others wait. A worker that ends, breaks its word or
// takes longer than the limit of a reading or a proof is ended, fails what it was asked for, and is
// started anew for the next request. A proof that the card has signed already stays one, when the
// worker fails in opening what was to be opened with it. Without a request for a while it is ended
// as well, so that its memory comes back.
//
// A listing that takes longer than its askers wait, because a card is slow to read or because a
// proof (which may wait for a person at a PIN pad) is before it, is answered with the tokens that
// the module had last. The reading goes on, and the next listing has what it found.
//
// Threads: the event loop's. Answers come from the loop, exactly once each, never before the
// asking call has returned; at the end of the worker's life those that are missing do not come.

#pragma once

#include <chrono>
#include <functional>
#include <list>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "services/hints/tokens.h"
#include "services/hints/tokens/event_source.h"
#include "services/hints/tokens/frames.h"
#include "services/hints/tokens/worker_process.h"
#include "services/hints/tokens/worker_protocol.h"

namespace vlm::service {

struct WorkerLimits {
    std::chrono::milliseconds list{5'000};   // how long an asker waits
    std::chrono::milliseconds read{60'000};  // how long the worker may take for a listing
    std::chrono::milliseconds prove{60'000};
    std::chrono::milliseconds idle{60'000};
};

class CardWorker {
public:
    using Tokens = std::vector<Token>;

    // The name is the module's, for the log. Loop and graveyard must outlive the worker.
    CardWorker(sd_event* event, WorkerGraveyard& graveyard, std::string name, WorkerCommand command,
               WorkerLimits limits);
    ~CardWorker();
    CardWorker(const CardWorker&) = delete;
    CardWorker& operator=(const CardWorker&) = delete;

    // No tokens when the module fails; why is in the log then.
    void list(std::function<void(const Tokens&)> answer);
    void prove(ProofRequest request, std::function<void(Proof)> answer);

    // As of the last listing.
    const Tokens& lastTokens() const { return _tokens; }
    LookAgain lookAgain() const;

private:
    struct Job {
        std::optional<ProofRequest> proof;          // none: a listing
        std::function<void(const Tokens&)> listed;  // empty once the asker waits no longer
        std::function<void(Proof)> proved;
        std::optional<Proof> signedProof;  // there already, while what is to be opened is not
        EventSource limit;
    };

    std::chrono::milliseconds patienceFor(const Job& job) const;
    void enqueue(Job job);
    void startNext();
    bool send(Job& job);
    bool ensureProcess();
    void receive();
    void receiveSecret();
    std::optional<std::size_t> receiveInto(std::span<std::uint8_t> room);
    void receiveAnswer(const Bytes& message);
    void takeProof(Proof proof);
    void takeOpening(OpeningAnswer answer);
    void finishList(ListAnswer answer);
    void finishProof(Proof proof);
    void limitCurrent();
    void waitedTooLong(std::list<Job>::iterator job);
    void fail(const std::string& why);
    void report(const std::string& line);
    void scheduleStart();
    void goIdle();

    sd_event* _event;
    WorkerGraveyard& _graveyard;
    std::string _name;
    WorkerCommand _command;
    WorkerLimits _limits;

    std::list<Job> _waiting;
    std::optional<Job> _current;
    EventSource _start;
    EventSource _idle;

    std::optional<WorkerProcess> _process;
    EventSource _readable;
    FrameAssembler _incoming;
    std::optional<SecretAssembler> _secret;  // while the next frame holds one
    bool _hasListed = false;                 // this process has told its tokens
    bool _isBehind = false;                  // an asker did not wait for the end of a listing
    bool _announcesNothing = false;

    Tokens _tokens;
    std::optional<std::string> _reported;  // the last line that was logged, while it stays true
};

}  // namespace vlm::service
