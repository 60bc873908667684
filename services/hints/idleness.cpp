#include "services/hints/idleness.h"

#include <utility>

namespace vlm::service {

class Idleness::Piece {
public:
    explicit Piece(std::weak_ptr<Idleness*> idleness) : _idleness(std::move(idleness)) {}
    Piece(const Piece&) = delete;
    Piece& operator=(const Piece&) = delete;
    ~Piece() {
        if (const auto idleness = _idleness.lock()) (*idleness)->end();
    }

private:
    std::weak_ptr<Idleness*> _idleness;
};

Idleness::Work Idleness::begin() {
    ++_pieces;
    _timer.reset();
    return std::make_shared<const Piece>(_self);
}

void Idleness::end() {
    if (--_pieces == 0) rest();
}

void Idleness::callWhenIdle(std::function<void()> call) {
    _idle = std::move(call);
    if (_pieces == 0) rest();
}

void Idleness::callWhenDone(std::function<void()> call) {
    _done = std::move(call);
    if (_pieces == 0) rest();
}

void Idleness::rest() {
    if (_done) return std::exchange(_done, nullptr)();
    if (!_idle || _parts.enough == std::chrono::milliseconds::zero()) return;
    _timer = _parts.callAfter(_parts.untilProofsEnd() + _parts.enough,
                              [this] { std::exchange(_idle, nullptr)(); });
}

}  // namespace vlm::service
