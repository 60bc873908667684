#include "platform/linux/loaded_windowing.h"

#include <dlfcn.h>

#include <system_error>

#include "platform/linux/windowing_module.h"
#include "platform/platform.h"
#include "platform/system_log.h"
#include "platform/token_framework.h"

namespace vlm::platform {

namespace {

constexpr Log kLog(kTokenFramework, "windowing");
constexpr const char* kModule = "vlm/vlm_qt_windowing.so";

// Beside the program, in a build tree and where it was installed.
std::vector<std::filesystem::path> installedModules() {
    std::error_code error;
    const auto program = std::filesystem::read_symlink("/proc/self/exe", error);
    if (error) return {};
    const auto folder = program.parent_path().parent_path();
    return {folder / "lib" / kModule, folder / VLM_LIBRARY_FOLDER / kModule};
}

Windowing* windowingOf(const std::filesystem::path& file) {
    // Never closed: a toolkit cannot be taken out of a process again.
    void* module = dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
    void* entry = module ? dlsym(module, kWindowingEntry) : nullptr;
    if (!entry) {
        kLog.error("loading the windows' module {}: {}", file.string(), std::string(dlerror()));
        return nullptr;
    }
    return reinterpret_cast<WindowingEntry>(entry)();
}

}  // namespace

std::unique_ptr<Window> LoadedWindowing::loadWindow(std::string_view description) {
    if (!_loaded) _loaded = loadModule();
    return _loaded ? _loaded->loadWindow(description) : nullptr;
}

void LoadedWindowing::activateIgnoringOthers() {
    if (_loaded) _loaded->activateIgnoringOthers();
}

Windowing* LoadedWindowing::loadModule() const {
    std::error_code error;
    for (const auto& file : _modules)
        if (std::filesystem::exists(file, error)) return windowingOf(file);
    kLog.error("the windows' module {} is not installed", std::string(kModule));
    return nullptr;
}

Windowing& Platform::windowing() {
    static auto& service = *new LoadedWindowing(installedModules());
    return service;
}

}  // namespace vlm::platform
