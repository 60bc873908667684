// The endpoint that owns an open descriptor, which is closed with the endpoint's last copy.

#pragma once

#include <memory>
#include <utility>

#include "platform/endpoint.h"
#include "platform/linux/file_descriptor.h"

namespace vlm::platform {

inline Endpoint ownedEndpoint(FileDescriptor descriptor) {
    struct Owner {
        explicit Owner(FileDescriptor owned) : descriptor(std::move(owned)) {}
        FileDescriptor descriptor;
        int number = descriptor.get();
    };
    const auto owner = std::make_shared<const Owner>(std::move(descriptor));
    return {std::shared_ptr<const int>(owner, &owner->number)};
}

}  // namespace vlm::platform
