// BindDialog: the window that offers to pair the user with an identity of an inserted card.
//
// Shapes:    one item of the pop-up for each public-key hash that can be paired, in one group for
//            each token. Choosing an item only selects it. Each button ends the operation.
// Ownership: holds its operation; the outlets belong to the window.
// Threads:   the main queue's only; it may be made on any thread. Pairing is background work, which
//            keeps the dialog until it is done.
// Blocking:  the first use loads the window; Do not show again waits for the disk.
// Errors:    a part that the window lacks is passed over.
// In tests:  tests/unit/ui/bind_dialog_*_test.cpp

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "bind/bind_operation.h"
#include "bind/pairing_dialog.h"
#include "ui/window_controller.h"

namespace vlm {

struct PairingOutcome;

class BindDialog final : public PairingDialog,
                         public WindowController,
                         public std::enable_shared_from_this<BindDialog> {
public:
    using Controls = std::vector<platform::Control*>;

    static std::shared_ptr<BindDialog> initWithOperation(std::shared_ptr<BindOperation> operation);

    // PairingDialog:
    bool showWindow() override;
    void refreshIdentities() override;
    void close() override { WindowController::close(); }
    void showAlert(const platform::Alert& alert, std::function<void()> dismissed) override;

    // The first disabling captures the controls that are enabled then. Only those are disabled and
    // enabled, by this and by every later call; without it, enabling does nothing.
    void setEnabled(bool enabled);

    // Adds the controls below the view that are enabled now, parents before their children.
    static void enabledObjects(Controls& enabled, platform::View& view);

    // Parts of the window; null until it is loaded.
    platform::IconView* iconView() const { return _iconView; }
    void setIconView(platform::IconView* iconView) { _iconView = iconView; }
    platform::TextLabel* identityLabel() const { return _identityLabel; }
    void setIdentityLabel(platform::TextLabel* identityLabel) { _identityLabel = identityLabel; }
    platform::PopUpButton* identityPopup() const { return _identityPopup; }
    void setIdentityPopup(platform::PopUpButton* identityPopup) { _identityPopup = identityPopup; }

private:
    explicit BindDialog(std::shared_ptr<BindOperation> operation);

    // WindowController:
    void connectOutlets(platform::Window& window) override;
    void windowDidLoad() override;

    void connectButton(platform::Window& window, const char* button, void (BindDialog::*clicked)());
    void okClicked();
    void cancelClicked();
    void dontShowAgainClicked();
    void finish(const BindOperation::OptionalHash& hash, const PairingOutcome& outcome);

    const std::shared_ptr<BindOperation> _operation;
    std::optional<Controls> _activeElements;
    platform::IconView* _iconView = nullptr;
    platform::TextLabel* _identityLabel = nullptr;
    platform::PopUpButton* _identityPopup = nullptr;
};

}  // namespace vlm
