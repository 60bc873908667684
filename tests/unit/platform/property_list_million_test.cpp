// Very many random values, other ones in every run: an integration test only because of its time.
//
// VLM_RANDOM_VALUES says how many; the build sets fewer where a sanitizer makes each take longer.
// VLM_RANDOM_SEED in the environment repeats the run that printed it.

#include <gtest/gtest.h>

#include <charconv>
#include <cstdlib>
#include <iostream>

#include "platform/property_list.h"
#include "random_values.h"

namespace vlm::platform {
namespace {

std::uint64_t seedOfThisRun() {
    const char* const given = std::getenv("VLM_RANDOM_SEED");
    if (given == nullptr) return std::random_device{}();
    const std::string_view digits = given;
    std::uint64_t seed = 0;
    const auto [end, error] = std::from_chars(digits.begin(), digits.end(), seed);
    EXPECT_TRUE(error == std::errc{} && end == digits.end()) << "VLM_RANDOM_SEED is no number";
    return seed;
}

// Depth 2 and up to seven elements: small ones, since it is their variety that counts.
TEST(PropertyListMillionTest, IsReadBackAsItWasWritten) {
    const std::uint64_t seed = seedOfThisRun();
    std::cout << "VLM_RANDOM_SEED=" << seed << ", " << VLM_RANDOM_VALUES << " values" << std::endl;
    RandomValues values(seed);

    for (int number = 0; number < VLM_RANDOM_VALUES; ++number) {
        const PropertyList value = values.next(2);

        const auto data = writeBinaryPropertyList(value);
        const auto again = data ? readPropertyList(*data) : std::nullopt;
        const auto rewritten = again ? writeBinaryPropertyList(*again) : std::nullopt;

        ASSERT_TRUE(again == value) << number << ": " << value.describe();
        ASSERT_TRUE(rewritten == data) << number << ": " << value.describe();
    }
}

}  // namespace
}  // namespace vlm::platform
