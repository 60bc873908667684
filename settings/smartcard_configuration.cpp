#include "settings/smartcard_configuration.h"

#include <cerrno>
#include <fstream>
#include <system_error>

#include "hints/hints_log.h"
#include "platform/types.h"

namespace vlm {

using hints::log;
using platform::Bytes;
using platform::PropertyList;

namespace fs = std::filesystem;

namespace {

// Opens the file; the answer is the system's error number, 0 when it is open.
int openPlainFile(std::ifstream& stream, const fs::path& file) {
    std::error_code error;
    const auto status = fs::status(file, error);
    if (error) return error.value();
    // To open a pipe is to wait for its other end, and a device may do anything.
    if (!fs::is_regular_file(status)) return static_cast<int>(std::errc::invalid_argument);
    stream.open(file, std::ios::binary);
    return stream ? 0 : errno;
}

std::streamoff sizeOf(std::istream& stream) {
    stream.seekg(0, std::ios::end);
    const std::streamoff size = stream.tellg();
    stream.seekg(0, std::ios::beg);
    return size;
}

}  // namespace

std::optional<PropertyList::Dictionary> copySmartCardConfiguration(const fs::path& file) {
    std::ifstream stream;
    if (const int error = openPlainFile(stream, file); error != 0) {
        log().debug("Failed to open configuration file (error {})", error);
        return std::nullopt;
    }
    return readSmartCardConfiguration(stream);
}

std::optional<PropertyList::Dictionary> readSmartCardConfiguration(std::istream& stream) {
    const std::streamoff size = sizeOf(stream);
    if (size < 0 || size > std::streamoff{kLargestConfiguration}) {
        log().error("Failed to create data for plist");
        return std::nullopt;
    }

    Bytes content(static_cast<std::size_t>(size));
    stream.read(reinterpret_cast<char*>(content.data()), size);
    const auto list = platform::readPropertyList(content, kConfigurationLimits);
    if (!list || !list->dictionary()) return std::nullopt;
    return *list->dictionary();
}

}  // namespace vlm
