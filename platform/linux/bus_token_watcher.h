// The token framework on the session bus: each watcher has a thread of its own, which listens to
// the user's hints service.

#pragma once

#include <memory>

#include "platform/token_watcher.h"

namespace vlm::platform {

class BusTokenFramework final : public TokenFramework {
public:
    std::shared_ptr<TokenWatcher> watchTokens() override;
};

}  // namespace vlm::platform
