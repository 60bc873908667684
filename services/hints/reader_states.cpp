#include "services/hints/reader_states.h"

#include <winscard.h>

#include <utility>

namespace vlm::service {

namespace {

// The upper half counts the cards that came and went, so that no short visit is missed.
constexpr ReaderStates::State kCardBits = 0xFFFF0000U | SCARD_STATE_PRESENT;

bool hasCard(ReaderStates::State state) { return (state & SCARD_STATE_PRESENT) != 0; }

}  // namespace

bool ReaderStates::setReaders(const std::vector<std::string>& readers) {
    std::map<std::string, State> now;
    for (const auto& reader : readers) now.emplace(reader, SCARD_STATE_UNAWARE);
    now.swap(_seen);
    bool areOthers = now.size() != _seen.size();
    for (auto& [reader, state] : _seen) {
        const auto before = now.extract(reader);
        if (before)
            state = before.mapped();
        else
            areOthers = true;
    }
    // A reader takes its card along.
    for (const auto& [reader, state] : now) _isCardEvent |= hasCard(state);
    return areOthers;
}

void ReaderStates::see(const std::string& reader, State state) {
    auto& before = _seen[reader];
    const bool isNew = before == SCARD_STATE_UNAWARE;
    const bool isChanged = isNew ? hasCard(state) : ((before ^ state) & kCardBits) != 0;
    _isCardEvent |= isChanged;
    _isCardPulled |= isChanged && hasCard(before) && (state & SCARD_STATE_UNAVAILABLE) == 0;
    before = state & ~State{SCARD_STATE_CHANGED};
}

bool ReaderStates::takeCardEvent() { return std::exchange(_isCardEvent, false); }

bool ReaderStates::takeCardPulled() { return std::exchange(_isCardPulled, false); }

}  // namespace vlm::service
