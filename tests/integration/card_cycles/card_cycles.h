// What must be true of cards that come and go a thousand times, whatever shows the dialogs.
//
// Threads: the main queue's.

#pragma once

#include <functional>
#include <set>
#include <string>

#include "bind/pairing_dialog.h"

namespace vlm::test {

// Where the dialogs are shown.
class DialogScreen {
public:
    virtual ~DialogScreen() = default;

    virtual std::shared_ptr<PairingDialog> makeDialog(
        const std::shared_ptr<BindOperation>& operation) = 0;

    // The identities that can be chosen there now; none when no dialog is shown.
    virtual std::set<std::string> shown() const = 0;
    // How many dialogs there are, shown or not.
    virtual int dialogs() const = 0;

    // Runs the main loop until it is so. It is asked after everything that happens on the loop.
    virtual void runUntil(const std::function<bool()>& isSo) = 0;
};

// One card alone: each time it comes an operation offers it, which ends when it leaves.
void insertAndPullOneCard(DialogScreen& screen);

// The same, by somebody who does not wait for the window.
void insertAndPullOneCardHastily(DialogScreen& screen);

// Of two cards one is in all the time: one operation follows.
void insertAndPullTwoCards(DialogScreen& screen);

// The same, by somebody who does not wait for the window, and leaves also none in.
void insertAndPullTwoCardsHastily(DialogScreen& screen);

}  // namespace vlm::test
