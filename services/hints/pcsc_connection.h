// PcscConnection: a connection to the machine's smart-card service, pcscd.
//
// Threads:   one; only cancel() may be called on another, while this exists.
// Blocking:  as said. Errors: the result codes of PC/SC.

#pragma once

#include <winscard.h>

#include <chrono>
#include <optional>
#include <string>
#include <vector>

#include "services/hints/reader_states.h"

namespace vlm::service {

class PcscConnection {
public:
    // Starts pcscd where the system does that on demand.
    PcscConnection()
        : _result(SCardEstablishContext(SCARD_SCOPE_SYSTEM, nullptr, nullptr, &_context)) {}
    ~PcscConnection() {
        if (isOpen()) SCardReleaseContext(_context);
    }
    PcscConnection(const PcscConnection&) = delete;
    PcscConnection& operator=(const PcscConnection&) = delete;

    bool isOpen() const { return _result == SCARD_S_SUCCESS; }

    // None when the service is gone.
    std::optional<std::vector<std::string>> readers() const;

    // Waits until a reader's state is another than the one seen, or readers come or go, or the time
    // is over; without one, it may also end now and then. False when the service is gone or
    // cancel() was called.
    bool waitForChange(ReaderStates& states, std::optional<std::chrono::milliseconds> most) const;

    // Ends a wait that is under way now; one that begins later does not hear of it.
    void cancel() const { SCardCancel(_context); }

private:
    SCARDCONTEXT _context = 0;
    const LONG _result;
};

}  // namespace vlm::service
