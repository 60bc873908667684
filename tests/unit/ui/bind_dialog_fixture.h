// The world of the tests of BindDialog: an operation with identities to offer, and a desktop.

#pragma once

#include <memory>
#include <string>
#include <vector>

#include "fake_bind_dialog_window.h"
#include "platform_test.h"
#include "ui/bind_dialog.h"

namespace vlm {

class BindDialogTest : public fakes::PlatformTest {
protected:
    using Bytes = platform::Bytes;
    using Strings = std::vector<std::string>;

    const std::string blue = "pkcs11:token=blue";
    const std::string red = "pkcs11:token=red";

    void SetUp() override { fakes::describeBindDialog(windowing()); }

    void offer(BindOperation::UnpairedIdentities identities) {
        operation->setUnpairedIdentities(std::move(identities));
    }

    fakes::FakeScreenWindow& screen() { return *windowing().windows.at(0); }
    fakes::FakePopUpButton& popUp() {
        return *screen().content.find<fakes::FakePopUpButton>("identityPopup");
    }
    fakes::FakeView& part(const std::string& name) { return *screen().content.find(name); }

    // The titles in the pop-up, with "-" for a separator.
    Strings offered() {
        Strings titles;
        for (const auto& item : popUp().items)
            titles.push_back(item.isSeparator ? "-" + item.title : item.title);
        return titles;
    }

    DialogActions actions() {
        return {
            [this](const auto& of, const auto& hash) {
                calls.push_back("ok");
                paired = hash;
                actedOn = of;
            },
            [this](const auto& of) {
                calls.push_back("cancel");
                actedOn = of;
            },
            [this](const auto& of) {
                calls.push_back("dontShowAgain");
                actedOn = of;
            },
        };
    }

    std::shared_ptr<BindOperation> operation = BindOperation::initWithUserName("alice");
    std::shared_ptr<BindDialog> dialog = BindDialog::initWithOperation(operation, actions());

    // What the actions were called with.
    Strings calls;
    BindOperation::OptionalHash paired;
    std::shared_ptr<BindOperation> actedOn;
};

}  // namespace vlm
