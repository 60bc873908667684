#include "services/hints/pinentry.h"

#include <sys/socket.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <span>
#include <string_view>
#include <utility>

namespace vlm::service {

namespace {

using namespace std::chrono_literals;

// How long a program may take to put its window away.
constexpr auto kFarewell = 1s;

// No pinentry says this much.
constexpr std::size_t kMostSaid = std::size_t{64} << 10U;

}  // namespace

Pinentry::Pinentry(sd_event* event, std::optional<Terminal> terminal, const PinentryForm& form,
                   PinPrompt::Answer answer)
    : _event(event),
      // The program keeps the time itself, for the warning and for the rest; this is for one that
      // does not.
      _patience(2 * form.patience + 10s),
      _dialog(form, terminal ? std::optional(PinentryTerminal{terminal->path(), terminal->type()})
                             : std::nullopt),
      _answer(std::move(answer)),
      _terminal(std::move(terminal)) {}

Pinentry::~Pinentry() {
    const bool ran = _program.has_value();
    _program.reset();
    if (ran && _terminal) _terminal->restore();
    wipeMemory(_said);
}

std::unique_ptr<Pinentry> Pinentry::start(sd_event* event, const ProgramToRun& program,
                                          std::optional<Terminal> terminal,
                                          const PinentryForm& form, PinPrompt::Answer answer) {
    std::unique_ptr<Pinentry> pinentry(
        new Pinentry(event, std::move(terminal), form, std::move(answer)));
    if (const auto reason = pinentry->run(program))
        pinentry->_time =
            callSoon(event, [self = pinentry.get(), why = *reason] { self->breakOff(why); });
    return pinentry;
}

std::optional<std::string> Pinentry::run(const ProgramToRun& program) {
    auto started = ChildProgram::start(program);
    if (!started) return started.refusal().text;
    _program = std::move(*started);
    _readable = callWhenReadable(_event, _program->socket(), [this] { read(); });
    _time =
        callAfter(_event, _patience, [this] { breakOff("the pinentry program does not answer"); });
    if (!_readable || !_time) return "the event loop has no room for it";
    return std::nullopt;
}

void Pinentry::read() {
    const auto got =
        recv(_program->socket(), _said.data() + _saidSize, _said.size() - _saidSize, 0);
    if (got < 0 && (errno == EAGAIN || errno == EINTR)) return;
    if (got <= 0) return breakOff("the pinentry program ended without an answer");
    _saidSize += static_cast<std::size_t>(got);
    _saidInAll += static_cast<std::size_t>(got);
    takeLines();
    if (_saidInAll > kMostSaid || _saidSize == _said.size())
        return breakOff("the pinentry program does not speak its protocol");
    if (_dialog.isOver() && !_hasLeft) leave();
}

void Pinentry::takeLines() {
    std::string_view rest(_said.data(), _saidSize);
    while (true) {
        const auto end = rest.find('\n');
        if (end == std::string_view::npos) break;
        const auto reply = _dialog.take(rest.substr(0, end));
        if (!reply.empty()) say(reply);
        rest.remove_prefix(end + 1);
    }
    const auto kept = rest.size();
    std::copy(rest.begin(), rest.end(), _said.begin());
    wipeMemory(std::span(_said).subspan(kept));
    _saidSize = kept;
}

// A program that does not listen is noticed when its end of the socket closes, or when its time is
// over.
void Pinentry::say(const std::string& text) {
    send(_program->socket(), text.data(), text.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
}

void Pinentry::leave() {
    _hasLeft = true;
    say("BYE\n");
    shutdown(_program->socket(), SHUT_WR);
    _time = callAfter(_event, kFarewell, [this] { finish(); });
}

// An answer that was given already stays what it is.
void Pinentry::breakOff(const std::string& reason) {
    _dialog.breakOff(reason);
    finish();
}

void Pinentry::finish() {
    _readable.reset();
    _time.reset();
    const bool ran = _program.has_value();
    _program.reset();
    if (ran && _terminal) _terminal->restore();
    // The answer may well destroy this object.
    std::exchange(_answer, nullptr)(_dialog.takeAnswer());
}

}  // namespace vlm::service
