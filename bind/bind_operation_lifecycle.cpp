// The life of an operation that is started: whether its user may pair, what tokens that come and go
// mean, and when the dialog is shown, refreshed and closed.

#include <algorithm>
#include <array>
#include <chrono>
#include <string_view>
#include <utility>

#include "bind/bind_operation.h"
#include "hints/hints_client.h"
#include "platform/accounts.h"
#include "platform/platform.h"
#include "platform/token_watcher.h"
#include "platform/work_queues.h"
#include "settings/smartcard_settings.h"
#include "util/bind_utils.h"

namespace vlm {

using platform::current;

namespace {

// They own desktops on which nobody works: the one that sets up a new machine, and the one that
// builds packages.
constexpr std::array<std::string_view, 2> kReservedAccounts{"gnome-initial-setup", "sbuild"};
constexpr std::string_view kGuestAccount = "guest";

constexpr std::chrono::seconds kPatience{30};  // from the start to the first dialog

bool isNobodysDesktop(const std::string& owner) {
    return owner.empty() || std::ranges::find(kReservedAccounts, owner) != kReservedAccounts.end();
}

}  // namespace

// A step for later, which is not taken when the operation is gone by then.
template <typename... Arguments>
auto BindOperation::whileAlive(void (BindOperation::*step)(Arguments...)) {
    return [weak = weak_from_this(), step](Arguments... arguments) {
        if (const auto self = weak.lock()) (self.get()->*step)(arguments...);
    };
}

// A step that follows from one that was taken is taken in any case.
void BindOperation::onMain(void (BindOperation::*step)()) {
    current().workQueues().runOnMain([self = shared_from_this(), step] { (self.get()->*step)(); });
}

void BindOperation::startWithReply(Reply reply) {
    setReply(std::move(reply));
    current().workQueues().runInBackground(whileAlive(&BindOperation::startUp));
}

void BindOperation::startUp() {
    if (!mayPair()) return report(BindResult::NotOffered, std::nullopt);

    _updateTokenCache(std::nullopt, /*requireWrapKey=*/true);
    if (!offersSomething()) {
        BindUtils::log().notice("no unpaired identities found");
        return report(BindResult::NotOffered, std::nullopt);
    }

    current().workQueues().runOnMainAfter(kPatience, whileAlive(&BindOperation::checkForDialog));
    watchTokens();
}

// Cheapest first: another user's operation never reaches the hints service.
bool BindOperation::mayPair() const {
    const auto& log = BindUtils::log();
    const std::string owner = BindUtils::processOwnerUserName();
    if (isNobodysDesktop(owner)) {
        log.notice("invalid current user: {}", owner);
        return false;
    }
    if (_userName != owner) {
        log.notice("User '{}' is not in active session", owner);
        return false;
    }
    log.debug("account of the current user: {}, id: {}", owner, current().accounts().userId(owner));
    if (owner == kGuestAccount) {
        log.notice("current user is guest account");
        return false;
    }
    if (VLGetSmartcardSetting("oneCardPerUser") != 0 && VLIsUserBound(owner)) {
        log.notice("Cannot pair user which is already paired");
        return false;
    }
    return true;
}

bool BindOperation::offersSomething() const {
    const auto identities = _unpairedIdentities.get();
    return identities && !identities->empty();
}

// The watcher is kept before it has its handler: the handler asks for it, and tokens that are there
// already are told at once.
void BindOperation::watchTokens() {
    const auto watcher = current().tokenFramework().watchTokens();
    setTokenWatcher(watcher);
    watcher->setInsertionHandler(whileAlive(&BindOperation::handleInsertion));
}

// The dialog's place is closed with the same step that finds it free, so that no handler on its way
// shows a dialog which nobody waits for any more.
void BindOperation::checkForDialog() {
    if (!_dialog.closeIfFree()) return;
    BindUtils::log().notice("token was removed before showing dialog");
    dropWatcher();
    report(BindResult::NotOffered, std::nullopt);
}

// Letting go of a watcher waits for its handler, which may wait for a card.
void BindOperation::dropWatcher() {
    auto watcher = tokenWatcher();
    setTokenWatcher(nullptr);
    current().workQueues().runInBackground([dropped = std::move(watcher)] {});
}

void BindOperation::handleInsertion(const std::string& token) {
    BindUtils::log().debug("token inserted: {}", token);
    tokenInserted(token);
    if (!offersSomething()) return onMain(&BindOperation::cancel);

    if (_dialog.isTaken()) {
        onMain(&BindOperation::refreshDialog);
    } else {
        makeDialog();
    }
    if (const auto watcher = tokenWatcher())
        watcher->addRemovalHandler(token, whileAlive(&BindOperation::handleRemoval));
}

void BindOperation::handleRemoval(const std::string& token) {
    const auto& log = BindUtils::log();
    log.debug("token removed: {}", token);
    tokenRemoved(token);
    const auto watcher = tokenWatcher();
    if (watcher && !watcher->tokenIds().empty() && offersSomething())
        return onMain(&BindOperation::refreshDialog);
    log.debug("all tokens were removed");
    onMain(&BindOperation::cancel);
}

// A dialog that was closed on the main queue meanwhile, or never kept, is not shown; it comes along
// all the same, since a dialog may go nowhere else.
void BindOperation::makeDialog() {
    auto made = _makeDialog ? _makeDialog(shared_from_this()) : nullptr;
    if (!made) return;
    _dialog.keep(made);
    current().workQueues().runOnMain(
        [self = shared_from_this(), dialog = std::move(made)] { self->showDialog(dialog); });
}

// A dialog without a window has no button that could end the operation.
void BindOperation::showDialog(const std::shared_ptr<PairingDialog>& made) {
    if (dialog() != made || made->showWindow()) return;
    BindUtils::log().error("the pairing dialog cannot be shown");
    dropWatcher();
    end(BindResult::NotOffered, std::nullopt);
}

void BindOperation::refreshDialog() {
    if (const auto shown = dialog()) shown->refreshIdentities();
}

void BindOperation::cancel() { end(BindResult::Canceled, std::nullopt); }

}  // namespace vlm
