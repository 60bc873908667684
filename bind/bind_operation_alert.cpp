// The end of an operation: what the user is told, and who is told after that.

#include <utility>

#include "bind/bind_operation.h"
#include "platform/localization.h"
#include "platform/platform.h"
#include "platform/text.h"
#include "platform/work_queues.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::current;
using platform::Error;

void BindOperation::finishWithResult(BindResult result, const OptionalHash& publicKeyHash,
                                     const std::optional<Error>& error) {
    BindUtils::log().debug("finishWithResult: result: {}, pubKeyHash: {}, error: {}",
                           static_cast<std::int32_t>(result), publicKeyHash, error);
    current().workQueues().runOnMain(
        [self = shared_from_this(), result, error] { self->_showResultAlert(result, error); });
}

void BindOperation::_showResultAlert(BindResult result, const std::optional<Error>& error) {
    const auto shown = result == BindResult::Failed ? dialog() : nullptr;
    if (!shown) return end(result, error);
    showFailure(shown, error);
}

// The dialog stays open below the sheet. It holds the operation, and the sheet must not: a sheet
// that nobody dismisses would keep both.
void BindOperation::showFailure(const std::shared_ptr<PairingDialog>& dialog,
                                const std::optional<Error>& error) {
    auto& texts = current().localization();
    platform::Alert alert;
    alert.style = platform::AlertStyle::Critical;
    alert.message = texts.text("PAIRING_FAILED");
    if (error && error->localizedDescription)
        alert.information =
            platform::text(texts.text("PAIRING_ERROR"), *error->localizedDescription);
    alert.button = texts.text("OK");
    dialog->showAlert(alert, [weak = weak_from_this(), error] {
        if (const auto self = weak.lock()) self->end(BindResult::Failed, error);
    });
}

void BindOperation::end(BindResult result, const std::optional<Error>& error) {
    closeDialog();
    report(result, error);
}

// The operation and its dialog part here, so that both can go. Since it may be the dialog that is
// calling, it goes only when that call is over.
void BindOperation::closeDialog() {
    auto closed = _dialog.letGo();
    if (!closed) return;
    closed->close();
    current().workQueues().runOnMain([dialog = std::move(closed)] {});
}

// Whoever is told may start another operation or give this one another reply: it is called outside
// of its place.
void BindOperation::report(BindResult result, const std::optional<Error>& error) const {
    const Reply told = reply();
    if (told) told(result, error);
}

}  // namespace vlm
