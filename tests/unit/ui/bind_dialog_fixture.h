// The world of the tests of BindDialog: an operation with identities to offer, and a desktop.

#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "fake_bind_dialog_window.h"
#include "fake_hints_service.h"
#include "platform_test.h"
#include "ui/bind_dialog.h"

namespace vlm {

class BindDialogTest : public fakes::PlatformTest {
protected:
    using Bytes = platform::Bytes;
    using Error = platform::Error;
    using Strings = std::vector<std::string>;

    const std::string blue = "pkcs11:token=blue";
    const std::string red = "pkcs11:token=red";

    void SetUp() override {
        fakes::describeBindDialog(windowing());
        accounts().add("alice", 1000);
        sessions().login(1000, /*onConsole=*/true);
        service.plugInto(ipc());
        operation->setReply([this](BindResult result, const std::optional<Error>& error) {
            replies.push_back(result);
            repliedError = error;
        });
    }

    void offer(BindOperation::UnpairedIdentities identities) {
        operation->setUnpairedIdentities(std::move(identities));
    }

    // A card with the identities {1} and {2}, in the reader and in the dialog.
    void offerBlueCard() {
        service.insert({blue, "Blue Card", {{{1}, "A"}, {{2}, "B"}}, Bytes{0xBB}});
        offer({{blue, {{{1}, "A"}, {{2}, "B"}}}});
        operation->setWrapKeysHashMap(BindOperation::WrapKeysHashMap{{{0xBB}, blue}});
    }

    fakes::FakeScreenWindow& screen() { return *windowing().windows.back(); }
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

    // How the operation was finished so far, each time as its line in the log says it.
    Strings finishes() {
        const std::string beginning = "finishWithResult: ";
        Strings lines;
        for (const auto& line : log().texts(platform::LogLevel::Debug))
            if (line.starts_with(beginning)) lines.push_back(line.substr(beginning.size()));
        return lines;
    }

    // What the lines so far belong to, each activity once, in order.
    Strings activities() {
        Strings names;
        for (const auto& line : log().lines())
            if (names.empty() || names.back() != line.activity) names.push_back(line.activity);
        return names;
    }

    fakes::FakeHintsService service;
    std::shared_ptr<BindOperation> operation = BindOperation::initWithUserName("alice");
    std::shared_ptr<BindDialog> dialog = BindDialog::initWithOperation(operation);

    // What the operation reported.
    std::vector<BindResult> replies;
    std::optional<Error> repliedError;
};

}  // namespace vlm
