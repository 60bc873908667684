#pragma once

#include <systemd/sd-bus.h>

#include "services/hints/caller.h"

namespace vlm::service {

class BusCallerWatch final : public CallerWatch {
public:
    // The bus outlives this and every watch.
    explicit BusCallerWatch(sd_bus* bus) : _bus(bus) {}

    std::unique_ptr<Watch> watch(const std::string& connection,
                                 std::function<void()> left) override;

private:
    sd_bus* _bus;
};

}  // namespace vlm::service
