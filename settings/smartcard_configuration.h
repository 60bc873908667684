// The optional configuration file of logins with smart cards: a property list of any format whose
// top level is a dictionary.
//
// Threads:  any.
// Blocking: on the file system; what is no plain file is not opened.
// Errors:   a file that is missing, larger than kLargestConfiguration, no property list or no
//           dictionary is none. The log names a file that cannot be opened at debug level, since
//           most machines have none, and one that there is no room for at error level. What the
//           file holds is never complained about.
// In tests: tests/unit/settings/smartcard_configuration_test.cpp

#pragma once

#include <cstddef>
#include <filesystem>
#include <istream>
#include <optional>

#include "platform/property_list.h"

namespace vlm {

inline constexpr const char* kSmartcardConfiguration = "/etc/SmartcardLogin.plist";

// Programs that let people in read the file; it must cost them neither time nor memory.
inline constexpr std::size_t kLargestConfiguration = std::size_t{4} << 20U;  // bytes
inline constexpr platform::PropertyListLimits kConfigurationLimits{
    .depth = 512, .objects = std::size_t{1} << 16U, .bytes = std::size_t{8} << 20U};

std::optional<platform::PropertyList::Dictionary> copySmartCardConfiguration(
    const std::filesystem::path& file = kSmartcardConfiguration);

// The same from a stream at its beginning. A stream that ends before its size counts as filled up
// with zeros.
std::optional<platform::PropertyList::Dictionary> readSmartCardConfiguration(std::istream& stream);

}  // namespace vlm
