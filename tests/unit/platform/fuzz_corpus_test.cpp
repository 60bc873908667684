// The fuzzers' corpora, which hold every input that ever showed a fault, in the ordinary tests.

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "fuzz/properties.h"

namespace vlm::fuzz {
namespace {

struct Seed {
    std::string name;
    platform::Bytes data;
};

std::vector<Seed> corpus(const char* folder) {
    std::vector<Seed> seeds;
    for (const auto& entry :
         std::filesystem::directory_iterator(std::filesystem::path(VLM_FUZZ_CORPUS) / folder)) {
        std::ifstream file(entry.path(), std::ios::binary);
        seeds.push_back({entry.path().filename(), {std::istreambuf_iterator(file), {}}});
    }
    return seeds;
}

TEST(FuzzCorpusTest, PropertyListsRoundTrip) {
    const auto seeds = corpus("property_list");
    ASSERT_FALSE(seeds.empty());

    for (const auto& seed : seeds) EXPECT_TRUE(propertyListRoundTrips(seed.data)) << seed.name;
}

TEST(FuzzCorpusTest, ReplyErrorsAreReadOrGeneric) {
    const auto seeds = corpus("reply_error");
    ASSERT_FALSE(seeds.empty());

    for (const auto& seed : seeds) EXPECT_TRUE(replyErrorIsSound(seed.data)) << seed.name;
}

}  // namespace
}  // namespace vlm::fuzz
