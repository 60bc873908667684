#include "platform/linux/gettext_catalogue.h"

#include <array>
#include <cstdint>
#include <fstream>
#include <system_error>

namespace vlm::platform {

namespace {

constexpr std::size_t kMostFileBytes = std::size_t{4} << 20U;
constexpr std::size_t kWordBytes = 4;

// The words and texts of a file, wherever it says they are.
class FileContent {
public:
    explicit FileContent(std::string_view bytes) : _bytes(bytes) {}

    // Learns the byte order from the magic number; false when this is no catalogue.
    bool recognise() {
        if (word(0) == kMagic) return true;
        _bigEndian = true;
        return word(0) == kMagic;
    }

    std::optional<std::uint32_t> word(std::size_t offset) const {
        if (offset > _bytes.size() || _bytes.size() - offset < kWordBytes) return std::nullopt;
        std::uint32_t value = 0;
        for (std::size_t byte = 0; byte < kWordBytes; ++byte) {
            const std::size_t place = _bigEndian ? byte : kWordBytes - 1 - byte;
            value = (value << 8U) | static_cast<std::uint8_t>(_bytes[offset + place]);
        }
        return value;
    }

    // The text that a pair of words, its length and its offset, stands for.
    std::optional<std::string_view> text(std::size_t pair) const {
        const auto length = word(pair);
        const auto offset = word(pair + kWordBytes);
        if (!length || !offset) return std::nullopt;
        if (*offset > _bytes.size() || _bytes.size() - *offset < *length) return std::nullopt;
        return _bytes.substr(*offset, *length);
    }

private:
    static constexpr std::uint32_t kMagic = 0x950412DE;

    std::string_view _bytes;
    bool _bigEndian = false;
};

}  // namespace

std::optional<GettextCatalogue> GettextCatalogue::read(const std::filesystem::path& file) {
    std::error_code error;
    const auto size = std::filesystem::file_size(file, error);
    if (error || size > kMostFileBytes) return std::nullopt;
    std::ifstream stream(file, std::ios::binary);
    std::string content(size, '\0');
    stream.read(content.data(), static_cast<std::streamsize>(content.size()));
    content.resize(static_cast<std::size_t>(stream.gcount()));
    return parse(content);
}

std::optional<GettextCatalogue> GettextCatalogue::parse(std::string_view bytes) {
    constexpr std::size_t kRevision = 4, kCount = 8, kKeys = 12, kTexts = 16;  // offsets
    FileContent content(bytes);
    if (!content.recognise() || content.word(kRevision).value_or(1) >> 16U != 0)
        return std::nullopt;
    const auto count = content.word(kCount);
    const auto keys = content.word(kKeys);
    const auto texts = content.word(kTexts);
    if (!count || !keys || !texts) return std::nullopt;
    GettextCatalogue catalogue;
    std::size_t room = bytes.size();
    for (std::size_t index = 0; index < *count; ++index) {
        const auto key = content.text(*keys + index * 2 * kWordBytes);
        const auto text = content.text(*texts + index * 2 * kWordBytes);
        if (!key || !text) return std::nullopt;
        // Texts may overlap in the file; without this bound a small one could hold very many.
        if (key->size() > room || text->size() > room - key->size()) return std::nullopt;
        room -= key->size() + text->size();
        // The empty key holds what the file says about itself.
        if (!key->empty()) catalogue._texts.emplace(*key, *text);
    }
    return catalogue;
}

std::string GettextCatalogue::text(std::string_view key) const {
    const auto found = _texts.find(key);
    return found == _texts.end() ? "" : found->second;
}

}  // namespace vlm::platform
