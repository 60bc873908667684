// This process as the kernel knows it.

#pragma once

#include "platform/process_info.h"

namespace vlm::platform {

class PosixProcessInfo final : public ProcessInfo {
public:
    UserId realUserId() const override;
    UserId effectiveUserId() const override;
    std::string ownerUserName() const override;
};

}  // namespace vlm::platform
