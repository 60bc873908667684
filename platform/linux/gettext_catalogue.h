// GettextCatalogue: the texts of one language from a compiled message catalogue (.mo).
//
// Errors: a file that is missing, too large or not well formed is none; no offset or length of the
//         file is trusted.
// Source: the GNU gettext manual, "The Format of GNU MO Files" (revision 0, either byte order).

#pragma once

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <string_view>

namespace vlm::platform {

class GettextCatalogue {
public:
    static std::optional<GettextCatalogue> read(const std::filesystem::path& file);
    static std::optional<GettextCatalogue> parse(std::string_view content);

    // The text for the key; empty when the catalogue has none.
    std::string text(std::string_view key) const;

private:
    std::map<std::string, std::string, std::less<>> _texts;
};

}  // namespace vlm::platform
