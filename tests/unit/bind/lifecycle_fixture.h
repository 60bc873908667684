// The world of the tests of an operation that is started: tokens that come and go, a dialog that
// does nothing, and one list of everything that happens.

#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "bind/pairing_dialog.h"
#include "bind_operation_fixture.h"
#include "scripted_tokens.h"

namespace vlm {

// What happens, in order; written by any thread.
class Events {
public:
    void add(std::string event) {
        const std::lock_guard lock(_mutex);
        _all.push_back(std::move(event));
    }

    // What happened since the last time.
    std::vector<std::string> take() {
        const std::lock_guard lock(_mutex);
        return std::exchange(_all, {});
    }

private:
    std::mutex _mutex;
    std::vector<std::string> _all;
};

// Holds its operation, as the real one does.
class SilentDialog final : public PairingDialog {
public:
    SilentDialog(std::shared_ptr<BindOperation> operation, Events& events)
        : _operation(std::move(operation)), _events(events) {}

    bool showWindow() override {
        _events.add("show");
        return hasWindow;
    }
    void refreshIdentities() override { _events.add("refresh"); }
    void close() override { _events.add("close"); }
    void showAlert(const platform::Alert& shown, std::function<void()> dismissed) override {
        _events.add("alert");
        alert = shown;
        dismiss = std::move(dismissed);
    }

    bool hasWindow = true;
    std::optional<platform::Alert> alert;
    std::function<void()> dismiss;

private:
    const std::shared_ptr<BindOperation> _operation;
    Events& _events;
};

class LifecycleTest : public BindOperationTest {
protected:
    using Error = platform::Error;
    using Happened = std::vector<std::string>;

    void SetUp() override {
        BindOperationTest::SetUp();
        fakePlatform().tokenFramework = &tokens;
        process().runAs(1000, "alice");
        accounts().add("alice", 1000);
        operation = makeOperation("alice");
    }

    // An operation that has not ended and its dialog hold each other.
    void TearDown() override {
        if (operation) operation->setDialog(nullptr);
    }

    std::shared_ptr<BindOperation> makeOperation(const std::string& user) {
        return BindOperation::initWithUserName(user, [this](const auto& forOperation) {
            auto made = std::make_shared<SilentDialog>(forOperation, events);
            dialog = made;
            events.add("make");
            return made;
        });
    }

    BindOperation::Reply reply() {
        return [this](BindResult result, const std::optional<Error>& error) {
            events.add("report " + std::to_string(static_cast<int>(result)));
            reportedError = error;
        };
    }

    // Starts, and does what that brings about in the background.
    void start() {
        operation->startWithReply(reply());
        workQueues().runBackground();
    }

    // A card comes or goes, for the service and for whoever watches.
    void plugBlue() {
        insertBlue();
        tokens.watcher.lock()->insert(blue);
    }
    void plugRed() {
        insertRed();
        tokens.watcher.lock()->insert(red);
    }
    void pull(const std::string& token) {
        service.remove(token);
        tokens.watcher.lock()->remove(token);
    }

    // An operation with the blue card in its dialog.
    void startWithBlueShown() {
        insertBlue();
        tokens.present = {blue};
        start();
        workQueues().runMain();
        ASSERT_EQ(events.take(), (Happened{"make", "show"}));
    }

    // What happens while the main queue is worked off.
    Happened onMain() {
        EXPECT_EQ(events.take(), Happened());
        workQueues().runMain();
        return events.take();
    }

    Events events;
    std::optional<Error> reportedError;
    ScriptedTokens tokens;
    std::weak_ptr<SilentDialog> dialog;  // the last one that was made
};

}  // namespace vlm
