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

TEST(FuzzCorpusTest, HoldsWhatEachPropertySays) {
    struct {
        const char* folder;
        bool (*holds)(std::span<const std::uint8_t> data);
    } const rows[] = {
        {"binary_property_list", binaryPropertyListIsSound},
        {"xml_property_list", xmlPropertyListIsSound},
        {"text_property_list", textPropertyListIsSound},
        {"property_list_round_trip", propertyListRoundTrips},
        {"reply_error", replyErrorIsSound},
    };
    for (const auto& row : rows) {
        const auto seeds = corpus(row.folder);
        ASSERT_FALSE(seeds.empty()) << row.folder;
        for (const auto& seed : seeds)
            EXPECT_TRUE(row.holds(seed.data)) << row.folder << "/" << seed.name;
    }
}

// Every list that was found for one format is a list for all of them.
TEST(FuzzCorpusTest, RoundTripsTheListsOfEachFormat) {
    for (const char* folder : {"binary_property_list", "xml_property_list", "text_property_list"})
        for (const auto& seed : corpus(folder))
            EXPECT_TRUE(propertyListRoundTrips(seed.data)) << folder << "/" << seed.name;
}

}  // namespace
}  // namespace vlm::fuzz
