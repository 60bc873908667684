#include "hints/hints_log.h"

#include "platform/token_framework.h"

namespace vlm::hints {

const platform::Log& log() {
    static const platform::Log handle(platform::kTokenFramework, "ZEM");
    return handle;
}

}  // namespace vlm::hints
