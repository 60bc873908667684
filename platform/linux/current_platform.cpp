#include "platform/platform.h"

namespace vlm::platform {

Platform& current() {
    static Platform platform;
    return platform;
}

}  // namespace vlm::platform
