// WorkerAnchors: what the configured trust modules hold, each read by a worker process that ends
// after it.
//
// What was read is good for a minute. The modules take it from files of their own that nobody
// announces a change of.

#pragma once

#include <chrono>
#include <functional>
#include <list>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "services/hints/anchors.h"
#include "services/hints/tokens/event_source.h"
#include "services/hints/tokens/frames.h"
#include "services/hints/tokens/module_registry.h"
#include "services/hints/tokens/worker_process.h"
#include "services/hints/tokens/worker_tokens.h"

namespace vlm::service {

class WorkerAnchors final : public Anchors {
public:
    static constexpr std::chrono::seconds kGoodFor{60};
    static constexpr std::chrono::seconds kPatience{5};  // as long as whoever lists cards waits

    // The loop outlives this. Nothing is looked up before it is first read.
    WorkerAnchors(sd_event* event, WorkerTokensOptions options)
        : _event(event), _options(std::move(options)), _graveyard(event) {}

    void read(std::function<void(const MachineAnchors&)> answer) override;

private:
    // A module that is being read.
    struct Reading {
        std::string name;
        std::optional<WorkerProcess> process;
        FrameAssembler incoming;
        EventSource readable;
        EventSource limit;
    };

    bool isFresh() const;
    void start(const ConfiguredModule& module);
    void receive(Reading& reading);
    void end(Reading& reading, const std::optional<MachineAnchors>& anchors);
    void answerAll();

    sd_event* _event;
    const WorkerTokensOptions _options;
    WorkerGraveyard _graveyard;

    std::vector<std::function<void(const MachineAnchors&)>> _askers;
    std::list<Reading> _readings;
    MachineAnchors _found;  // in the round under way
    MachineAnchors _anchors;
    std::optional<std::chrono::steady_clock::time_point> _read;
    EventSource _soon;
};

}  // namespace vlm::service
