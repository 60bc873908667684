// ReaderStates: what the card readers were last seen to be in, and which changes mean that a card
// has come or gone.
//
// A reader's state also tells who uses its card. That changes with each listing of the cards, and
// must not be the reason for the next one.
//
// Threads: a value. In tests: tests/unit/services/reader_states_test.cpp

#pragma once

#include <map>
#include <string>
#include <vector>

namespace vlm::service {

class ReaderStates {
public:
    using State = unsigned long;  // as PC/SC has it

    // The readers that there are now. True when there are others than before.
    bool setReaders(const std::vector<std::string>& readers);

    // What a reader was seen in last; SCARD_STATE_UNAWARE for a new one.
    const std::map<std::string, State>& seen() const { return _seen; }

    // What a reader is seen in now.
    void see(const std::string& reader, State state);

    // Whether a card has come or gone since this was asked last.
    bool takeCardEvent();

    // Whether a card has left a reader that stays, since this was asked last. A reader that goes
    // with its card may have been unplugged, or pcscd may be ending.
    bool takeCardPulled();

private:
    std::map<std::string, State> _seen;
    bool _isCardEvent = false;
    bool _isCardPulled = false;
};

}  // namespace vlm::service
