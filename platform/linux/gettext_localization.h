// Texts from gettext catalogues: FOLDER/LANGUAGE/LC_MESSAGES/Bind.mo.
//
// The catalogues are read here, and not by the C library's gettext(): that finds nothing in the
// locale "C", nothing in a locale which is not installed, and no English behind a LANGUAGE that
// does not name it, unless the locale or the environment of the whole process is changed.

#pragma once

#include <filesystem>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "platform/linux/gettext_catalogue.h"
#include "platform/localization.h"

namespace vlm::platform {

class GettextLocalization final : public Localization {
public:
    // The folders in the order in which they are searched, and the languages, best first. The
    // catalogues are read with the first text.
    GettextLocalization(std::vector<std::filesystem::path> folders,
                        std::vector<std::string> languages)
        : _folders(std::move(folders)), _languages(std::move(languages)) {}

    std::string text(std::string_view key) override;

private:
    void readCatalogues();

    const std::vector<std::filesystem::path> _folders;
    const std::vector<std::string> _languages;
    std::once_flag _read;
    std::vector<GettextCatalogue> _catalogues;  // written once, under _read
};

// The languages that LANGUAGE, LC_ALL, LC_MESSAGES and LANG ask for, each followed by what is less
// special, and English at the end. "de_AT.UTF-8" gives de_AT, de, en.
struct LanguageEnvironment {
    std::string language;  // a list, separated by colons
    std::string locale;    // the first of the three others that is not empty
};
std::vector<std::string> wantedLanguages(const LanguageEnvironment& environment);

}  // namespace vlm::platform
