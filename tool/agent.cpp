#include "tool/agent.h"

#include <cstdint>
#include <utility>

#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"
#include "tool/exit_status.h"
#include "ui/bind_dialog.h"
#include "util/bind_utils.h"
#include "util/tool_identifier.h"

namespace vlm {

using platform::current;

namespace {

void logEnd(BindResult result, const std::optional<platform::Error>& error) {
    const auto& log = BindUtils::log();
    switch (result) {
        case BindResult::Succeeded:
            return log.debug("vlm bind succeeded");
        case BindResult::Failed:
            return log.debug("vlm bind failed: {}", error);
        case BindResult::Canceled:
            return log.debug("vlm bind canceled");
        case BindResult::NotOffered:
            return log.debug("vlm bind interrupted");
    }
    log.debug("vlm bind finished with unknown result: {}", static_cast<std::int32_t>(result));
}

}  // namespace

void Agent::handleEvent(const std::string& notification) {
    if (notification != platform::kNewTokenNotification && notification != kForceBindUi) return;
    const platform::LogActivity activity("new token notification");
    const auto bind = startedBind(notification);
    if (!bind) return;
    bind->startWithReply([agent = shared_from_this()](BindResult result,
                                                      const std::optional<platform::Error>& error) {
        agent->finish(result, error);
    });
}

// None when there is a bind already, or may be none; then the process ends.
std::shared_ptr<BindOperation> Agent::startedBind(const std::string& notification) {
    const auto& log = BindUtils::log();
    const std::lock_guard lock(_bindLock);
    if (_runningBind) {
        log.debug("vlm bind is already running");
        return nullptr;
    }
    if (!BindUtils::isBindEnabled()) {
        log.notice("vlm bind is not enabled, exiting");
        current().application().exit(kExitSuccess);
        return nullptr;
    }
    // Whoever asks for the dialog wants it, whatever was chosen before.
    if (!BindUtils::isBindAllowed() && notification != kForceBindUi) {
        log.notice("vlm bind is not allowed, exiting");
        current().application().exit(kExitSuccess);
        return nullptr;
    }
    log.debug("starting vlm bind");
    _transaction = current().application().openTransaction();
    _runningBind = BindOperation::init(_makeDialog);
    return _runningBind;
}

// An operation may tell its end again, for a token that leaves late; the first one counts.
void Agent::finish(BindResult result, const std::optional<platform::Error>& error) {
    std::shared_ptr<BindOperation> ended;  // let go outside of the lock
    std::unique_ptr<platform::Application::Transaction> transaction;
    {
        const std::lock_guard lock(_bindLock);
        transaction = std::move(_transaction);
        if (!transaction) return;
    }
    logEnd(result, error);
    transaction.reset();
    {
        const std::lock_guard lock(_bindLock);
        ended = std::exchange(_runningBind, nullptr);
        BindUtils::log().notice("no bind is running, exiting");
    }
    current().application().exit(kExitSuccess);
}

int runAgent() {
    const auto& log = BindUtils::log();
    log.debug("starting notify event handler");
    const auto agent = std::make_shared<Agent>(BindDialog::initWithOperation);
    current().application().setEventHandler(
        [agent](const std::string& notification) { agent->handleEvent(notification); });
    log.debug("entering the main loop");
    return current().application().run();
}

}  // namespace vlm
