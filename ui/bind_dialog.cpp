#include "ui/bind_dialog.h"

#include <algorithm>
#include <string>
#include <utility>

#include "platform/platform.h"

namespace vlm {

namespace {

constexpr int kAboveOrdinaryWindows = 999;
constexpr int kBadgePoints = 32;

}  // namespace

std::shared_ptr<BindDialog> BindDialog::initWithOperation(
    std::shared_ptr<BindOperation> operation) {
    return std::shared_ptr<BindDialog>(new BindDialog(std::move(operation)));
}

BindDialog::BindDialog(std::shared_ptr<BindOperation> operation)
    : WindowController("BindDialog"), _operation(std::move(operation)) {}

void BindDialog::connectOutlets(platform::Window& window) {
    setIconView(window.iconView("iconView"));
    setIdentityLabel(window.textLabel("identityLabel"));
    setIdentityPopup(window.popUpButton("identityPopup"));
    connectButton(window, "okButton", &BindDialog::okClicked);
    connectButton(window, "cancelButton", &BindDialog::cancelClicked);
    connectButton(window, "dontShowAgainButton", &BindDialog::dontShowAgainClicked);
}

// An action may let the dialog go, which then has to last until the action's end.
void BindDialog::connectButton(platform::Window& window, const char* button,
                               void (BindDialog::*clicked)()) {
    window.onClick(button, [dialog = weak_from_this(), clicked] {
        if (const auto self = dialog.lock()) ((*self).*clicked)();
    });
}

void BindDialog::windowDidLoad() {
    WindowController::windowDidLoad();
    if (_iconView) _iconView->showSecurityLock("AppIcon", kBadgePoints);
    refreshIdentities();
    platform::Window& shown = *window();
    shown.setLevel(kAboveOrdinaryWindows);
    shown.centre();
    shown.makeKeyAndOrderFront();
    platform::current().windowing().activateIgnoringOthers();
}

// Loading it brings it to the front already.
bool BindDialog::showWindow() {
    return isWindowLoaded() ? WindowController::showWindow() : window() != nullptr;
}

void BindDialog::refreshIdentities() {
    if (!_identityPopup) return;
    _identityPopup->removeAllItems();
    const auto identities = _operation->unpairedIdentities();
    if (!identities) return;

    bool hasGroup = false;
    for (const auto& token : *identities) {
        std::vector<platform::MenuItem> group;
        if (std::exchange(hasGroup, true)) group.push_back({"", std::nullopt, true});
        for (const auto& [hash, title] : token.second) group.push_back({title, hash, false});
        // The separator is sorted along with the items; its empty title puts it at the head, and
        // a stable sort leaves it there also before an identity without a title.
        std::ranges::stable_sort(group, {}, &platform::MenuItem::title);
        for (const auto& item : group) _identityPopup->append(item);
    }
}

void BindDialog::showAlert(const platform::Alert& alert, std::function<void()> dismissed) {
    if (auto* shown = window())
        shown->showSheet(alert, std::move(dismissed));
    else
        dismissed();
}

void BindDialog::setEnabled(bool enabled) {
    if (!enabled && !_activeElements) {
        _activeElements.emplace();
        if (auto* shown = window()) enabledObjects(*_activeElements, shown->contentView());
    }
    if (!_activeElements) return;
    for (auto* control : *_activeElements) control->setEnabled(enabled);
}

void BindDialog::enabledObjects(Controls& enabled, platform::View& view) {
    for (auto* part : view.subviews()) {
        auto* control = part->control();
        if (control && control->isEnabled()) enabled.push_back(control);
        enabledObjects(enabled, *part);
    }
}

}  // namespace vlm
