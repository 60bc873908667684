// What is wrong in a property list that settings or the configuration file are kept in.
//
// Threads:  a function of its arguments. Errors: none.
// In tests: tests/unit/vlmctl/property_list_check_test.cpp

#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/property_list.h"

namespace vlm::control {

// What a file is read for, which decides what a key in it means.
enum class FileRole {
    Settings,       // a record of the smart-card domain
    Configuration,  // /etc/SmartcardLogin.plist
    Unknown,        // either: what has a meaning in one of them is known
};

// By the file's name; the folder does not matter, so that a draft can be checked anywhere.
FileRole roleOf(std::string_view path);

// How large such a file may be for a login to read it.
std::size_t mostBytes(FileRole role);

struct Finding {
    bool isWarning = false;  // the login reads the file all the same
    std::string text;
    std::size_t line = 0;  // counted from 1; 0 where the format has no lines
    std::size_t column = 0;
};

struct CheckReport {
    platform::PropertyListFormat format = platform::PropertyListFormat::Text;
    std::size_t keys = 0;
    std::vector<Finding> findings;

    bool hasProblems() const;
};

// Reads with the limits of the login.
CheckReport checkPropertyList(std::span<const std::uint8_t> data, FileRole role);

}  // namespace vlm::control
