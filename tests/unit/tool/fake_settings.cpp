#include "fake_settings.h"

#include "settings/smartcard_settings.h"

namespace vlm::fakes {

FakeSettings& settings() {
    static FakeSettings settings;
    return settings;
}

}  // namespace vlm::fakes

std::int32_t VLGetSmartcardSetting(const vlm::platform::String& key) {
    auto& settings = vlm::fakes::settings();
    settings.asked.push_back(key.utf8());
    return settings.values[key.utf8()];
}
