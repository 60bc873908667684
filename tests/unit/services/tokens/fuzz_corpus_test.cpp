#include "tests/unit/fuzz_corpus.h"

#include <gtest/gtest.h>

#include "fuzz/card_properties.h"

namespace vlm::fuzz {
namespace {

TEST(CardFuzzCorpusTest, HoldsWhatEachPropertySays) {
    struct {
        const char* folder;
        bool (*holds)(std::span<const std::uint8_t> data);
    } const rows[] = {
        {"worker_request", workerRequestIsSound},
        {"worker_answer", workerAnswerIsSound},
        {"wrapped_unlock_key", wrappedUnlockKeyIsSound},
    };
    for (const auto& row : rows) {
        const auto seeds = corpus(row.folder);
        ASSERT_FALSE(seeds.empty()) << row.folder;
        for (const auto& seed : seeds)
            EXPECT_TRUE(row.holds(seed.data)) << row.folder << "/" << seed.name;
    }
}

}  // namespace
}  // namespace vlm::fuzz
