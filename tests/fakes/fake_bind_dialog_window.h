// The pairing window as resources/ui/BindDialog.ui describes it: the same names, in the same order.

#pragma once

#include "fake_windowing.h"

namespace vlm::fakes {

inline void describeBindDialog(FakeWindowing& windowing) {
    windowing.describe("BindDialog", [](FakeScreenWindow& window) {
        window.content.add<FakeIconView>("iconView");
        window.content.add<FakeTextLabel>("messageLabel");
        window.content.add<FakeTextLabel>("informationLabel");
        auto& identity = window.content.add("identityRow");
        identity.add<FakeTextLabel>("identityLabel");
        identity.add<FakePopUpButton>("identityPopup");
        auto& buttons = window.content.add("buttonRow");
        buttons.add<FakeButton>("dontShowAgainButton");
        buttons.add<FakeButton>("cancelButton");
        buttons.add<FakeButton>("okButton");
        window.closeButton = "cancelButton";
    });
}

}  // namespace vlm::fakes
