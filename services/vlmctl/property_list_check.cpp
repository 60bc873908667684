#include "services/vlmctl/property_list_check.h"

#include <algorithm>

#include "platform/linux/preferences_record.h"
#include "platform/text.h"
#include "services/vlmctl/known_key.h"
#include "settings/known_settings.h"
#include "settings/smartcard_configuration.h"

namespace vlm::control {

namespace {

using platform::PropertyList;
using platform::text;

Finding problem(std::string words) { return {false, std::move(words), 0, 0}; }
Finding warning(std::string words) { return {true, std::move(words), 0, 0}; }

std::string_view kindOf(const PropertyList& value) {
    if (value.text()) return "text";
    if (value.bytes()) return "data";
    if (value.date()) return "a date";
    if (value.array()) return "an array";
    if (value.dictionary()) return "a dictionary";
    return value.boolean() ? "a boolean" : "a number";
}

bool isNumber(const PropertyList& value) {
    return value.integer() || value.unsignedInteger() || value.real();
}

bool isWide(const PropertyList& value) {
    if (const auto integer = value.integer())
        return *integer != static_cast<std::int32_t>(*integer);
    return value.unsignedInteger().has_value();
}

void checkSetting(const std::string& key, const PropertyList& value,
                  std::vector<Finding>& findings) {
    if (isWide(value))
        findings.push_back(warning(
            text("\"{}\" does not fit in 32 bits, and only the low ones of it count", key)));
    if (value.boolean() || isNumber(value)) return;
    findings.push_back(problem(
        text("\"{}\" is {}, and counts as absent: the login reads a boolean or a number only", key,
             kindOf(value))));
}

void checkUnknown(const std::string& key, std::vector<Finding>& findings) {
    const auto nearest = nearestKey(key);
    findings.push_back(
        warning(nearest ? text("\"{}\" is no known key; did you mean \"{}\"?", key, *nearest)
                        : text("\"{}\" is no known key, and is not read", key)));
}

void checkEntry(const std::string& key, const PropertyList& value, FileRole role,
                std::vector<Finding>& findings) {
    if (key == kAttributeMapping) {
        if (role == FileRole::Settings)
            findings.push_back(
                warning(text("\"{}\" is read from {} only", key, kSmartcardConfiguration)));
    } else if (findSetting(key)) {
        checkSetting(key, value, findings);
        if (role == FileRole::Configuration)
            findings.push_back(
                warning(text("\"{}\" is a setting, and is not read from {}; \"vlmctl set\" sets it",
                             key, kSmartcardConfiguration)));
    } else {
        checkUnknown(key, findings);
    }
}

std::string_view nameOf(std::string_view path) {
    const auto slash = path.rfind('/');
    return slash == std::string_view::npos ? path : path.substr(slash + 1);
}

}  // namespace

FileRole roleOf(std::string_view path) {
    if (nameOf(path) == nameOf(kSmartcardConfiguration)) return FileRole::Configuration;
    if (nameOf(path) == text("{}.plist", kSmartcardDomain)) return FileRole::Settings;
    return FileRole::Unknown;
}

bool CheckReport::hasProblems() const {
    return !std::ranges::all_of(findings, &Finding::isWarning);
}

std::size_t mostBytes(FileRole role) {
    return role == FileRole::Configuration ? kLargestConfiguration : platform::kLargestRecord;
}

CheckReport checkPropertyList(std::span<const std::uint8_t> data, FileRole role) {
    const auto examined = platform::examinePropertyList(
        data, role == FileRole::Configuration ? kConfigurationLimits : platform::kRecordLimits);
    CheckReport report{.format = examined.format, .keys = 0, .findings = {}};
    if (!examined.value) {
        report.findings.push_back({false, examined.problem, examined.line, examined.column});
        return report;
    }
    const auto* dictionary = examined.value->dictionary();
    if (!dictionary) {
        report.findings.push_back(problem(
            text("the top level is {}, and has to be a dictionary", kindOf(*examined.value))));
        return report;
    }
    report.keys = dictionary->size();
    for (const auto& [key, value] : *dictionary) checkEntry(key, value, role, report.findings);
    return report;
}

}  // namespace vlm::control
