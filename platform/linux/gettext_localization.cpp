#include "platform/linux/gettext_localization.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <system_error>

#include "platform/platform.h"

namespace vlm::platform {

namespace {

constexpr const char* kCatalogueFile = "LC_MESSAGES/Bind.mo";
constexpr const char* kLastLanguage = "en";

// A language becomes a part of a path; what the environment says must not lead elsewhere.
bool isLanguage(std::string_view text) {
    return !text.empty() && std::ranges::all_of(text, [](unsigned char character) {
        return std::isalnum(character) != 0 || character == '_' || character == '@';
    });
}

bool isUntranslated(std::string_view locale) {
    return locale.empty() || locale == "C" || locale == "POSIX";
}

void add(std::vector<std::string>& languages, const std::string& language) {
    if (isLanguage(language) && std::ranges::find(languages, language) == languages.end())
        languages.push_back(language);
}

// A locale's parts are language[_TERRITORY][.codeset][@modifier]. The texts are always UTF-8.
void addWithLessSpecial(std::vector<std::string>& languages, const std::string& locale) {
    const auto upTo = [](const std::string& text, const char* end) {
        return text.substr(0, text.find_first_of(end));
    };
    const std::string withTerritory = upTo(locale, ".@");
    const std::string plain = upTo(locale, "_.@");
    const auto at = locale.find('@');
    const std::string modifier = at == locale.npos ? "" : locale.substr(at);
    add(languages, withTerritory + modifier);
    add(languages, plain + modifier);
    add(languages, withTerritory);
    add(languages, plain);
}

LanguageEnvironment processEnvironment() {
    const auto value = [](const char* name) -> std::string {
        const char* text = std::getenv(name);
        return text ? text : "";
    };
    std::string locale;
    for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANG"})
        if (locale.empty()) locale = value(name);
    return {value("LANGUAGE"), locale};
}

// Beside the program, for one in a build tree and one that was installed to another place; then
// where it was meant to be installed.
std::vector<std::filesystem::path> catalogueFolders() {
    std::vector<std::filesystem::path> folders;
    std::error_code error;
    const auto program = std::filesystem::read_symlink("/proc/self/exe", error);
    if (!error) folders.push_back(program.parent_path().parent_path() / "share/locale");
    folders.emplace_back(VLM_LOCALE_FOLDER);
    return folders;
}

}  // namespace

std::vector<std::string> wantedLanguages(const LanguageEnvironment& environment) {
    std::vector<std::string> languages;
    if (!isUntranslated(environment.locale)) {
        const std::string& list =
            environment.language.empty() ? environment.locale : environment.language;
        for (std::size_t start = 0; start < list.size();) {
            const auto end = std::min(list.find(':', start), list.size());
            const std::string each = list.substr(start, end - start);
            if (each == "C" || each == "POSIX") break;
            addWithLessSpecial(languages, each);
            start = end + 1;
        }
    }
    add(languages, kLastLanguage);
    return languages;
}

std::string GettextLocalization::text(std::string_view key) {
    std::call_once(_read, [this] { readCatalogues(); });
    for (const auto& catalogue : _catalogues)
        if (auto text = catalogue.text(key); !text.empty()) return text;
    return "";
}

void GettextLocalization::readCatalogues() {
    for (const auto& language : _languages) {
        for (const auto& folder : _folders) {
            auto catalogue = GettextCatalogue::read(folder / language / kCatalogueFile);
            if (!catalogue) continue;
            _catalogues.push_back(*std::move(catalogue));
            break;
        }
    }
}

Localization& Platform::localization() {
    static auto& service =
        *new GettextLocalization(catalogueFolders(), wantedLanguages(processEnvironment()));
    return service;
}

}  // namespace vlm::platform
