#pragma once

#include <map>

#include "platform/localization.h"

namespace vlm::fakes {

class FakeLocalization final : public platform::Localization {
public:
    // What a test does to the world.
    void translate(const std::string& key, const std::string& text) { _texts[key] = text; }

    std::string text(std::string_view key) override {
        const auto found = _texts.find(std::string(key));
        return found == _texts.end() ? "" : found->second;
    }

private:
    std::map<std::string, std::string> _texts;
};

}  // namespace vlm::fakes
