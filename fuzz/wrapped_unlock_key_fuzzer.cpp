#include <cstdlib>

#include "fuzz/card_properties.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (!vlm::fuzz::wrappedUnlockKeyIsSound({data, size})) std::abort();
    return 0;
}
