// The two instances of the service, put together from their parts. Each brings its parts up in the
// order in which they stand in its function and claims its name on the bus last, so that nobody is
// answered by a service that is half ready; they go down in the opposite order.
//
// Errors: the text says why an instance cannot run; empty when it ran and has ended.

#pragma once

#include <string>

#include "services/hints/options.h"
#include "services/hints/service_loop.h"

namespace vlm::service {

struct InstanceEnd {
    std::string whyNotStarted;
    int exitStatus = 0;
};

InstanceEnd runSystemInstance(ServiceLoop& loop, const Options& options);
InstanceEnd runUserInstance(ServiceLoop& loop, const Options& options);

}  // namespace vlm::service
