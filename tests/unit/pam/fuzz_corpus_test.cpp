// The corpus of the fuzzer, which holds every conversation that ever showed a fault.

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "fuzz/pam_properties.h"
#include "platform/types.h"
#include "platform_test.h"

namespace vlm::fuzz {
namespace {

class PamFuzzCorpusTest : public fakes::PlatformTest {};

TEST_F(PamFuzzCorpusTest, LetsNobodyInWithoutTheServicesWord) {
    int seeds = 0;
    for (const auto& entry : std::filesystem::directory_iterator(
             std::filesystem::path(VLM_FUZZ_CORPUS) / "pam_conversation")) {
        std::ifstream file(entry.path(), std::ios::binary);
        const platform::Bytes data{std::istreambuf_iterator<char>(file),
                                   std::istreambuf_iterator<char>()};
        EXPECT_TRUE(pamConversationIsSound(data)) << entry.path();
        ++seeds;
    }
    EXPECT_GT(seeds, 0);
}

}  // namespace
}  // namespace vlm::fuzz
