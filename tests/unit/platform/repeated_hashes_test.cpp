#include "platform/repeated_hashes.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <vector>

namespace vlm::platform {
namespace {

// Hardly two of which are equal.
std::vector<std::uint32_t> randomHashes(std::size_t count) {
    std::mt19937 random(1);
    std::vector<std::uint32_t> hashes(count);
    for (std::uint32_t& hash : hashes) hash = static_cast<std::uint32_t>(random());
    return hashes;
}

TEST(RepeatedHashesTest, KeepsNoneWhereThereIsNone) { EXPECT_EQ(keepRepeatedHashes({}), 0u); }

TEST(RepeatedHashesTest, ForgetsASingleHash) {
    std::vector<std::uint32_t> hashes = {7};

    EXPECT_EQ(keepRepeatedHashes(hashes), 0u);
    EXPECT_EQ(hashes[0], kNoHash);
}

TEST(RepeatedHashesTest, KeepsEveryRepeatedHash) {
    const std::uint32_t lowest = 1;
    const std::uint32_t highest = 0xFFFFFFFF;
    std::vector<std::uint32_t> hashes = {lowest, 0x80000000, highest, lowest, highest, lowest};

    EXPECT_EQ(keepRepeatedHashes(hashes), 5u);
    EXPECT_EQ(hashes, (std::vector{lowest, kNoHash, highest, lowest, highest, lowest}));
}

TEST(RepeatedHashesTest, KeepsRepeatedHashesAmongManyOthers) {
    auto hashes = randomHashes(10000);
    const std::uint32_t first = hashes.front();
    hashes.push_back(first);

    keepRepeatedHashes(hashes);

    EXPECT_EQ(hashes.front(), first);
    EXPECT_EQ(hashes.back(), first);
}

// Were they all kept, nothing would be wrong, only slow, and nobody would notice.
TEST(RepeatedHashesTest, KeepsFewOfRandomHashes) {
    auto hashes = randomHashes(10000);

    const std::size_t kept = keepRepeatedHashes(hashes);

    EXPECT_LT(kept, 1000u);
    EXPECT_EQ(kept, hashes.size() - static_cast<std::size_t>(std::ranges::count(hashes, kNoHash)));
}

}  // namespace
}  // namespace vlm::platform
