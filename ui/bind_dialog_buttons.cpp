// What the buttons of the pairing dialog do. Each ends the operation once, on the main queue.

#include <utility>

#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/work_queues.h"
#include "ui/authorized_pairing.h"
#include "ui/bind_dialog.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::current;
using platform::LogActivity;

namespace {

constexpr const char* kClickedPair = "clicked 'Pair'";
constexpr const char* kClickedCancel = "clicked 'Cancel'";
constexpr const char* kClickedDoNotShowAgain = "clicked 'Do not show again'";

}  // namespace

// The controls stay disabled: the end of the operation closes the dialog.
void BindDialog::okClicked() {
    const LogActivity activity(kClickedPair);
    const auto chosen = _identityPopup ? _identityPopup->selectedItem() : std::nullopt;
    const auto hash = chosen ? chosen->object : std::nullopt;
    BindUtils::log().debug("selected pubkey hash: {}", hash);
    setEnabled(false);
    // A dialog may go on the main queue only, and so it is given back to that with the outcome.
    current().workQueues().runInBackground([dialog = shared_from_this(), hash]() mutable {
        const LogActivity worker(kClickedPair);
        const auto outcome = pairWithAuthorization(*dialog->_operation, hash);
        current().workQueues().runOnMain([dialog = std::move(dialog), hash, outcome] {
            const LogActivity end(kClickedPair);
            dialog->finish(hash, outcome);
        });
    });
}

void BindDialog::finish(const BindOperation::OptionalHash& hash, const PairingOutcome& outcome) {
    if (!outcome.lacksUnlockKey)
        return _operation->finishWithResult(outcome.result, hash, outcome.error);
    auto& texts = current().localization();
    // The sheet goes with the dialog and must not keep it: one that nobody dismisses would keep
    // both.
    showAlert({platform::AlertStyle::Critical, texts.text("STORE_UNLOCK_KEY_FAILED"),
               texts.text("STORE_UNLOCK_KEY_FAILED_INFO"), texts.text("OK")},
              [weak = weak_from_this(), hash, outcome] {
                  if (const auto self = weak.lock())
                      self->_operation->finishWithResult(outcome.result, hash, outcome.error);
              });
}

void BindDialog::cancelClicked() {
    const LogActivity activity(kClickedCancel);
    _operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
}

void BindDialog::dontShowAgainClicked() {
    const LogActivity activity(kClickedDoNotShowAgain);
    BindUtils::setBindAllowed(false);
    _operation->finishWithResult(BindResult::Canceled, std::nullopt, std::nullopt);
}

}  // namespace vlm
