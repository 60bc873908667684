#include "tests/unit/fuzz_corpus.h"

#include <gtest/gtest.h>

#include "fuzz/properties.h"

namespace vlm::fuzz {
namespace {

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
