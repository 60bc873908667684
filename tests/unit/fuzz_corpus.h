// A fuzzer's corpus, which holds every input that ever showed a fault, for the ordinary tests.

#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "platform/types.h"

namespace vlm::fuzz {

struct Seed {
    std::string name;
    platform::Bytes data;
};

inline std::vector<Seed> corpus(const char* folder) {
    std::vector<Seed> seeds;
    for (const auto& entry :
         std::filesystem::directory_iterator(std::filesystem::path(VLM_FUZZ_CORPUS) / folder)) {
        std::ifstream file(entry.path(), std::ios::binary);
        seeds.push_back({entry.path().filename(), {std::istreambuf_iterator(file), {}}});
    }
    return seeds;
}

}  // namespace vlm::fuzz
