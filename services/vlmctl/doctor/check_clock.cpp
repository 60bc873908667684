#include "services/vlmctl/doctor/checks.h"
#include "services/vlmctl/shown.h"

namespace vlm::control::doctor {

// Certificates have dates; with a clock that was reset none is valid yet.
Findings checkClock(const Patient& patient) {
    constexpr std::int64_t kBuilt = VLM_BUILD_TIME;
    const auto time = pointInTime(patient.now);
    if (patient.now >= kBuilt) return {ok("clock", "it is " + time)};
    return {problem("clock", "it is " + time + ", which is before this program was made",
                    "Set the clock, and let it be kept: \"timedatectl set-ntp true\".")};
}

}  // namespace vlm::control::doctor
