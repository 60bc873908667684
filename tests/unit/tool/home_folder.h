// The environment's home folder as a test wants it; put back as it was afterwards.

#pragma once

#include <cstdlib>
#include <optional>
#include <string>

namespace vlm::fakes {

class HomeFolder {
public:
    HomeFolder() {
        if (const char* home = std::getenv("HOME")) _before = home;
    }
    ~HomeFolder() { _before ? set(*_before) : unset(); }
    HomeFolder(const HomeFolder&) = delete;
    HomeFolder& operator=(const HomeFolder&) = delete;

    void set(const std::string& path) { ::setenv("HOME", path.c_str(), 1); }
    void unset() { ::unsetenv("HOME"); }

private:
    std::optional<std::string> _before;
};

}  // namespace vlm::fakes
