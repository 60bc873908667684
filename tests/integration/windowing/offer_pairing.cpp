// Offers its user a pairing as the agent does, on the real platform, and prints how that ended.

#include <iostream>

#include "platform/linux/event_loop_work_queues.h"
#include "ui/bind_dialog.h"
#include "util/bind_utils.h"

int main() {
    using namespace vlm;
    const auto operation = BindOperation::initWithUserName(BindUtils::processOwnerUserName(),
                                                           BindDialog::initWithOperation);
    operation->startWithReply([](BindResult result, const auto&) {
        std::cout << "result " << static_cast<int>(result) << '\n';
        platform::mainLoop().end(0);
    });
    return platform::mainLoop().run();
}
