#include "platform/preferences.h"

#include <algorithm>

namespace vlm::platform {

namespace {

// Leaves room in a file name for what is written before and after a domain.
constexpr std::size_t kLongestDomain = 200;

bool belongsInDomain(char each) {
    return (each >= 'a' && each <= 'z') || (each >= 'A' && each <= 'Z') ||
           (each >= '0' && each <= '9') || each == '.' || each == '-' || each == '_';
}

}  // namespace

bool isPreferencesDomain(std::string_view domain) {
    return !domain.empty() && domain.size() <= kLongestDomain && domain.front() != '.' &&
           domain.back() != '.' && domain.find("..") == std::string_view::npos &&
           std::ranges::all_of(domain, belongsInDomain);
}

}  // namespace vlm::platform
