#include "services/hints/tokens/worker_anchors.h"

#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/system_log.h"

namespace vlm::service {
namespace {

using std::chrono::steady_clock;

constexpr platform::Log kLog("org.vlm.token", "hints");

void append(const std::vector<platform::Bytes>& some, std::vector<platform::Bytes>& all) {
    all.insert(all.end(), some.begin(), some.end());
}

}  // namespace

void WorkerAnchors::read(std::function<void(const MachineAnchors&)> answer) {
    _askers.push_back(std::move(answer));
    if (_askers.size() > 1) return;
    if (!isFresh())
        for (const auto& module : configuredModules(_options.folders, ModuleKind::Trust))
            start(module);
    if (_readings.empty()) _soon = callSoon(_event, [this] { answerAll(); });
}

bool WorkerAnchors::isFresh() const { return _read && steady_clock::now() - *_read < kGoodFor; }

void WorkerAnchors::start(const ConfiguredModule& module) {
    auto& reading = _readings.emplace_back();
    reading.name = platform::harmlessText(module.name);
    reading.process =
        startWorker({{_options.workerProgram, "anchors", module.path}, _options.environment});
    // From the loop, like every end: the round is not over while it is being started.
    if (!reading.process) {
        reading.limit = callSoon(_event, [this, &reading] { end(reading, std::nullopt); });
        return;
    }
    reading.readable = callWhenReadable(_event, reading.process->socket.get(),
                                        [this, &reading] { receive(reading); });
    reading.limit = callAfter(_event, kPatience, [this, &reading] { end(reading, std::nullopt); });
}

void WorkerAnchors::receive(Reading& reading) {
    std::array<std::uint8_t, 64UL * 1024> piece;
    const ssize_t size =
        recv(reading.process->socket.get(), piece.data(), piece.size(), MSG_DONTWAIT);
    if (size < 0 && (errno == EAGAIN || errno == EINTR)) return;
    if (size <= 0) return end(reading, std::nullopt);
    switch (reading.incoming.add(std::span(piece).first(static_cast<std::size_t>(size)))) {
        case FrameState::Incomplete:
            return;
        case FrameState::TooLong:
            return end(reading, std::nullopt);
        case FrameState::Complete:
            return end(reading, decodeAnchors(reading.incoming.take()));
    }
}

void WorkerAnchors::end(Reading& reading, const std::optional<MachineAnchors>& anchors) {
    if (anchors) {
        append(anchors->trusted, _found.trusted);
        append(anchors->distrusted, _found.distrusted);
    } else {
        kLog.error("the trust module {} is of no use: it cannot be loaded, or does not answer",
                   reading.name);
    }
    reading.readable.reset();
    if (reading.process) _graveyard.bury(std::move(*reading.process));
    _readings.remove_if([&reading](const Reading& each) { return &each == &reading; });
    if (!_readings.empty()) return;
    _anchors = std::exchange(_found, {});
    _read = steady_clock::now();
    answerAll();
}

// An asker may ask again at once.
void WorkerAnchors::answerAll() {
    const auto askers = std::exchange(_askers, {});
    for (const auto& asker : askers) asker(_anchors);
}

}  // namespace vlm::service
