// The smart-card settings, for programs.
//
// Shapes:   a setting is a small whole number; switches are 1 and 0. Keys are case-sensitive.
// Threads:  any.
// Blocking: no.
// Errors:   none; a key without a value has its default.
// Log:      subsystem org.vlm.token, category ZEM.
// In tests: tests/unit/hints/smartcard_settings_test.cpp

#pragma once

#include <cstdint>

#include "platform/export.h"
#include "platform/string.h"

// The setting's value. This version answers the built-in defaults and reads no stored value: 1 for
// "allowSmartCard" and "UserPairing", 0 for every other key. Programs that ask today get what an
// administrator set as soon as there is a place to set it.
VLM_EXPORT std::int32_t VLGetSmartcardSetting(const vlm::platform::String& key);
