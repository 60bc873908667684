#include "services/hints/tokens/module_registry.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <optional>
#include <set>
#include <string_view>

#include "platform/harmless_text.h"
#include "platform/system_log.h"

namespace vlm::service {
namespace {

namespace fs = std::filesystem;

using Settings = std::map<std::string, std::string, std::less<>>;

constexpr platform::Log kLog("org.vlm.token", "hints");
constexpr std::string_view kProgram = "vlmhintsd";
constexpr std::string_view kEnding = ".module";
constexpr std::size_t kMostFileBytes = 64UL * 1024;

std::string_view trimmed(std::string_view text) {
    constexpr std::string_view kBlank = " \t\r\f\v";
    const std::size_t first = text.find_first_not_of(kBlank);
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(kBlank) - first + 1);
}

std::optional<std::string> contentOf(const fs::path& file) {
    std::ifstream stream(file, std::ios::binary);
    if (!stream) return {};
    std::string content(kMostFileBytes + 1, '\0');
    stream.read(content.data(), static_cast<std::streamsize>(content.size()));
    if (stream.bad()) return {};
    content.resize(static_cast<std::size_t>(stream.gcount()));
    return content;
}

// The settings in a file's text; none when it is not such a file.
std::optional<Settings> parse(std::string_view content) {
    if (content.size() > kMostFileBytes || content.find('\0') != std::string_view::npos) return {};
    Settings settings;
    while (!content.empty()) {
        const std::size_t end = std::min(content.find('\n'), content.size());
        const std::string_view line = trimmed(content.substr(0, end));
        content.remove_prefix(std::min(end + 1, content.size()));
        if (line.empty() || line.front() == '#') continue;
        const std::size_t colon = line.find(':');
        const std::string_view name = trimmed(line.substr(0, colon));
        if (colon == std::string_view::npos || name.empty()) return {};
        settings.insert_or_assign(std::string(name), std::string(trimmed(line.substr(colon + 1))));
    }
    return settings;
}

std::string_view settingOf(const Settings& settings, std::string_view name) {
    const auto setting = settings.find(name);
    return setting == settings.end() ? std::string_view() : std::string_view(setting->second);
}

bool namesThisProgram(std::string_view list) {
    constexpr std::string_view kSeparators = ", \t";
    while (!list.empty()) {
        const std::size_t end = std::min(list.find_first_of(kSeparators), list.size());
        if (list.substr(0, end) == kProgram) return true;
        list.remove_prefix(std::min(end + 1, list.size()));
    }
    return false;
}

bool isWanted(const Settings& settings, ModuleKind kind) {
    if (settingOf(settings, "module").empty() || !settingOf(settings, "remote").empty())
        return false;
    const bool isTrust = settingOf(settings, "trust-policy") == "yes";
    if (isTrust != (kind == ModuleKind::Trust)) return false;
    if (const auto only = settingOf(settings, "enable-in"); !only.empty())
        return namesThisProgram(only);
    return !namesThisProgram(settingOf(settings, "disable-in"));
}

int priorityOf(const Settings& settings) {
    const std::string_view text = settingOf(settings, "priority");
    int priority = 0;
    std::from_chars(text.data(), text.data() + text.size(), priority);
    return priority;
}

// Adds the folder's files by name. What is there already goes before what comes.
void addFolder(const std::string& folder, std::map<std::string, Settings>& modules) {
    std::error_code error;
    for (fs::directory_iterator file(folder, error), end; !error && file != end;
         file.increment(error)) {
        const std::string name = file->path().filename();
        if (name.starts_with('.') || !name.ends_with(kEnding)) continue;
        const auto content = contentOf(file->path());
        auto settings = content ? parse(*content) : std::nullopt;
        if (!settings) {
            kLog.error("the card module file {} is left out: it {}",
                       platform::harmlessText(file->path().string()),
                       content ? "is not well formed" : "cannot be read");
            continue;
        }
        modules[name.substr(0, name.size() - kEnding.size())].merge(*settings);
    }
}

}  // namespace

ModuleFolders ModuleFolders::ofThisMachine() {
    return {VLM_P11_PACKAGE_FILES, VLM_P11_ADMIN_FILES, VLM_P11_MODULES};
}

std::vector<ConfiguredModule> configuredModules(const ModuleFolders& folders, ModuleKind kind) {
    std::map<std::string, Settings> byName;
    addFolder(folders.adminFiles, byName);
    addFolder(folders.packageFiles, byName);

    std::vector<std::pair<int, ConfiguredModule>> modules;
    for (const auto& [name, settings] : byName) {
        if (!isWanted(settings, kind)) continue;
        std::error_code error;
        const fs::path path =
            fs::canonical(fs::path(folders.modules) / settingOf(settings, "module"), error);
        if (error)
            kLog.error("the card module {} is left out: there is no {}",
                       platform::harmlessText(name),
                       platform::harmlessText(settingOf(settings, "module")));
        else
            modules.push_back({priorityOf(settings), {name, path}});
    }
    // Modules of one priority stay in the order of their names.
    std::ranges::stable_sort(modules, std::ranges::greater(),
                             [](const auto& each) { return each.first; });

    std::vector<ConfiguredModule> once;
    std::set<std::string> paths;
    for (auto& [priority, module] : modules)
        if (paths.insert(module.path).second) once.push_back(std::move(module));
    return once;
}

}  // namespace vlm::service
