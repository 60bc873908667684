// Smart-card settings as a test wants them.

#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace vlm::fakes {

struct FakeSettings {
    std::map<std::string, std::int32_t> values;
    std::vector<std::string> asked;
};

FakeSettings& settings();

}  // namespace vlm::fakes
