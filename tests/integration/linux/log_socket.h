// LogSocket: a socket in the place of the journal's or syslog's, and what arrives there.

#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "platform/linux/file_descriptor.h"

namespace vlm::test {

class LogSocket {
public:
    // Listens at the path, with the folders above it made. Throws when it cannot.
    explicit LogSocket(const std::filesystem::path& path);

    // The packets that have arrived since the last time.
    std::vector<std::string> take();

private:
    platform::FileDescriptor _socket;
};

// A packet of the journal's protocol, taken apart.
using JournalFields = std::map<std::string, std::string>;
JournalFields journalFields(const std::string& packet);

}  // namespace vlm::test
