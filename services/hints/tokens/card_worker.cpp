#include "services/hints/tokens/card_worker.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <utility>

#include "platform/system_log.h"

namespace vlm::service {
namespace {

constexpr platform::Log kLog("org.vlm.token", "hints");

// Seen by the next read, or by a request that is sent before it.
constexpr const char* kEnded = "crashed or ended";

bool hasHungUp(int socket) {
    pollfd state{.fd = socket, .events = 0, .revents = 0};
    return poll(&state, 1, 0) == 1 && (state.revents & POLLHUP) != 0;
}

}  // namespace

CardWorker::CardWorker(sd_event* event, WorkerGraveyard& graveyard, std::string name,
                       WorkerCommand command, WorkerLimits limits)
    : _event(event),
      _graveyard(graveyard),
      _name(std::move(name)),
      _command(std::move(command)),
      _limits(limits) {}

CardWorker::~CardWorker() {
    if (_process) _graveyard.bury(std::move(*_process));
}

void CardWorker::list(std::function<void(const Tokens&)> answer) {
    Job job;
    job.listed = std::move(answer);
    enqueue(std::move(job));
}

void CardWorker::prove(ProofRequest request, std::function<void(Proof)> answer) {
    Job job;
    job.proof = std::move(request);
    job.proved = std::move(answer);
    enqueue(std::move(job));
}

std::chrono::milliseconds CardWorker::patienceFor(const Job& job) const {
    return job.proof ? _limits.prove : _limits.list;
}

void CardWorker::enqueue(Job job) {
    const auto place = _waiting.insert(_waiting.end(), std::move(job));
    place->limit = callAfter(_event, patienceFor(*place), [this, place] { waitedTooLong(place); });
    scheduleStart();
}

// From the loop, so that nobody is answered before the asking call has returned.
void CardWorker::scheduleStart() {
    if (!_current && !_waiting.empty()) _start = callSoon(_event, [this] { startNext(); });
}

void CardWorker::startNext() {
    if (_current || _waiting.empty()) return;
    _idle.reset();
    _current = std::move(_waiting.front());
    _waiting.pop_front();
    if (_current->proof && !encodeProofRequest(*_current->proof))
        return finishProof({Proof::Outcome::CardFailed,
                            {},
                            PinState::Ready,
                            "the PIN or the challenge is longer than any card takes"});
    limitCurrent();
    if (!ensureProcess()) return fail("has no process to run in");
    if (!send(*_current))
        fail(hasHungUp(_process->socket.get()) ? kEnded : "does not take requests");
}

// Time spent in the queue is not held against the worker.
void CardWorker::limitCurrent() {
    const auto end = [this] { fail("did not answer in time and was ended"); };
    const auto most = _current->proof ? _limits.prove : _limits.read;
    if (_current->proof || most <= _limits.list) {
        _current->limit = callAfter(_event, most, end);
        return;
    }
    _current->limit = callAfter(_event, _limits.list, [this, end, rest = most - _limits.list] {
        _current->limit = callAfter(_event, rest, end);
        _isBehind = true;
        std::exchange(_current->listed, nullptr)(_tokens);
    });
}

bool CardWorker::send(Job& job) {
    if (!job.proof) {
        const auto message = encodeListRequest();
        return message && sendFrames(_process->socket.get(), *message, nullptr);
    }
    const auto message = encodeProofRequest(*job.proof);
    const bool sent = message && sendFrames(_process->socket.get(), *message, &job.proof->pin);
    job.proof->pin = Secret();
    return sent;
}

bool CardWorker::ensureProcess() {
    if (_process) return true;
    _process = startWorker(_command);
    if (!_process) return false;
    _incoming = {};
    _secret.reset();
    _hasListed = false;
    _readable = callWhenReadable(_event, _process->socket.get(), [this] { receive(); });
    return _readable != nullptr;
}

// None when there is nothing to read, or the worker was ended.
std::optional<std::size_t> CardWorker::receiveInto(std::span<std::uint8_t> room) {
    const ssize_t size = recv(_process->socket.get(), room.data(), room.size(), MSG_DONTWAIT);
    if (size > 0) return static_cast<std::size_t>(size);
    if (size == 0 || (errno != EAGAIN && errno != EINTR)) fail(kEnded);
    return {};
}

void CardWorker::receive() {
    if (_secret) return receiveSecret();
    std::array<std::uint8_t, 64UL * 1024> piece;
    const auto room = std::span(piece).first(std::min(piece.size(), _incoming.missing()));
    const auto size = receiveInto(room);
    if (!size) return;
    if (!_current) return fail("spoke without being asked");
    switch (_incoming.add(room.first(*size))) {
        case FrameState::Incomplete:
            return;
        case FrameState::TooLong:
            return fail("gave an answer that is too long");
        case FrameState::Complete:
            return receiveAnswer(_incoming.take());
    }
}

void CardWorker::receiveSecret() {
    const auto size = receiveInto(_secret->room());
    if (!size) return;
    switch (_secret->filled(*size)) {
        case FrameState::Incomplete:
            return;
        case FrameState::TooLong:
            return fail("gave an answer that is too long");
        case FrameState::Complete:
            break;
    }
    Secret opened = _secret->take();
    _secret.reset();
    if (opened.empty() == _current->signedProof->whyNotOpened.empty())
        return fail("gave an answer that makes no sense");
    Proof proof = std::move(*_current->signedProof);
    if (!opened.empty()) proof.opened = std::make_shared<const Secret>(std::move(opened));
    finishProof(std::move(proof));
}

void CardWorker::receiveAnswer(const Bytes& message) {
    auto answer = decodeAnswer(message);
    if (!answer) return fail("gave an answer that makes no sense");
    if (const auto* failed = std::get_if<FailedAnswer>(&*answer))
        return fail("is of no use: " + failed->reason);
    if (auto* listed = std::get_if<ListAnswer>(&*answer); listed != nullptr && !_current->proof)
        return finishList(std::move(*listed));
    if (auto* proof = std::get_if<Proof>(&*answer);
        proof != nullptr && _current->proof && !_current->signedProof)
        return takeProof(std::move(*proof));
    if (auto* opening = std::get_if<OpeningAnswer>(&*answer);
        opening != nullptr && _current->signedProof)
        return takeOpening(std::move(*opening));
    fail("gave an answer to another question");
}

void CardWorker::takeProof(Proof proof) {
    if (proof.outcome != Proof::Outcome::Signed || !_current->proof->open)
        return finishProof(std::move(proof));
    _current->signedProof = std::move(proof);
}

void CardWorker::takeOpening(OpeningAnswer answer) {
    _current->signedProof->whyNotOpened = std::move(answer.whyNot);
    _secret.emplace(kMostOpenedBytes);
}

void CardWorker::finishList(ListAnswer answer) {
    // A listing may say "as before", but not before there was one.
    if (!answer.tokens && !_hasListed) return fail("gave an answer that makes no sense");
    if (answer.tokens) _tokens = std::move(*answer.tokens);
    _hasListed = true;
    _isBehind = false;
    _announcesNothing = answer.announcesNothing;
    std::string problems;
    for (const std::string& problem : answer.problems)
        problems += (problems.empty() ? "" : "; ") + problem;
    if (problems.empty())
        _reported.reset();
    else
        report("the card module " + _name + ": " + problems);

    const auto listed = std::move(_current->listed);
    goIdle();
    if (listed) listed(_tokens);
}

void CardWorker::finishProof(Proof proof) {
    const auto proved = std::move(_current->proved);
    goIdle();
    proved(std::move(proof));
}

void CardWorker::goIdle() {
    _current.reset();
    scheduleStart();
    if (!_process) return;
    _idle = callAfter(_event, _limits.idle, [this] {
        _readable.reset();
        _graveyard.letLeave(std::move(*_process));
        _process.reset();
    });
}

void CardWorker::waitedTooLong(std::list<Job>::iterator job) {
    const Job late = std::move(*job);
    _waiting.erase(job);
    if (!late.proof) {
        _isBehind = true;
        return late.listed(_tokens);
    }
    late.proved(
        {Proof::Outcome::CardFailed, {}, PinState::Ready, "the card is busy with another login"});
}

// Ends the worker, and with it what it was asked for, if anything.
void CardWorker::fail(const std::string& why) {
    _readable.reset();
    _idle.reset();
    if (_process) _graveyard.bury(std::move(*_process));
    _process.reset();
    _tokens.clear();
    _isBehind = false;
    report("the card module " + _name + " " + why);
    if (!_current) return;
    Job job = std::move(*_current);
    _current.reset();
    scheduleStart();
    if (!job.proof) {
        if (job.listed) job.listed({});
        return;
    }
    const std::string reason = "the module of the card (" + _name + ") " + why;
    if (!job.signedProof)
        return job.proved({Proof::Outcome::CardFailed, {}, PinState::Ready, reason});
    Proof proof = std::move(*job.signedProof);
    proof.whyNotOpened = reason;
    job.proved(std::move(proof));
}

LookAgain CardWorker::lookAgain() const {
    if (_isBehind) return LookAgain::Soon;
    return _announcesNothing ? LookAgain::NowAndThen : LookAgain::OnCardEvent;
}

// The same trouble again and again is said once.
void CardWorker::report(const std::string& line) {
    if (_reported != line) kLog.error("{}", line);
    _reported = line;
}

}  // namespace vlm::service
