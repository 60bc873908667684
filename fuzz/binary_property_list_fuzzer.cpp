#include <cstdlib>

#include "fuzz/properties.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (!vlm::fuzz::binaryPropertyListIsSound({data, size})) std::abort();
    return 0;
}
