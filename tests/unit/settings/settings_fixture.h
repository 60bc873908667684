// The world of the tests of the settings: preferences in memory, and the log as one list of lines.

#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "platform_test.h"
#include "settings/known_settings.h"

namespace vlm {

class SettingsTest : public fakes::PlatformTest {
protected:
    using PropertyList = platform::PropertyList;
    using String = platform::String;
    using Lines = std::vector<std::string>;

    const std::string domain{kSmartcardDomain};

    void force(const std::string& key, PropertyList value) {
        preferences().force(key, domain, std::move(value));
    }
    void setForMachine(const std::string& key, PropertyList value) {
        preferences().put(key, domain, platform::PreferencesUser::Any, std::move(value));
    }
    void setForUser(const std::string& key, PropertyList value) {
        preferences().put(key, domain, platform::PreferencesUser::Current, std::move(value));
    }

    // The lines of the settings, each behind its level.
    Lines logged() {
        constexpr const char* kLevels[] = {"error: ", "default: ", "info: ", "debug: "};
        Lines lines;
        for (const auto& line : log().lines()) {
            EXPECT_EQ(line.subsystem, "org.vlm.token");
            EXPECT_EQ(line.category, "ZEM");
            lines.push_back(kLevels[static_cast<std::size_t>(line.level)] + line.text);
        }
        return lines;
    }
};

}  // namespace vlm
