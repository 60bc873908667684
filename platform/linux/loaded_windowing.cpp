#include "platform/linux/loaded_windowing.h"

#include <dlfcn.h>

#include <algorithm>
#include <cstdlib>
#include <optional>
#include <system_error>

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

// Null when the module lacks it.
template <typename Entry>
Entry entry(void* module, const char* name) {
    return reinterpret_cast<Entry>(dlsym(module, name));
}

// What the toolkit's loop calls for the one that it drives.
struct DrivenLoop {
    MainLoop& loop;
    const EndLoopEntry endToolkit;
    std::optional<int> ended;

    static void dispatch(void* driven) {
        auto& self = *static_cast<DrivenLoop*>(driven);
        if (!self.ended) self.ended = self.loop.dispatch();
        if (self.ended) self.endToolkit();
    }
};

}  // namespace

std::unique_ptr<Window> LoadedWindowing::loadWindow(std::string_view description) {
    if (!_loaded) load();
    return _loaded ? _loaded->loadWindow(description) : nullptr;
}

void LoadedWindowing::activateIgnoringOthers() {
    if (_loaded) _loaded->activateIgnoringOthers();
}

// The module is never closed: a toolkit cannot be taken out of a process again. Of what a toolkit
// calls, a window reaches little: to look up all of it at once would be a good part of the time
// until the window is there.
void LoadedWindowing::load() {
    std::error_code error;
    const auto file = std::ranges::find_if(
        _modules, [&](const auto& each) { return std::filesystem::exists(each, error); });
    if (file == _modules.end())
        return kLog.error("the windows' module {} is not installed", std::string(kModule));

    void* module = dlopen(file->c_str(), RTLD_LAZY | RTLD_LOCAL);
    if (module) {
        _runLoop = entry<RunLoopEntry>(module, kRunLoopEntry);
        _endLoop = entry<EndLoopEntry>(module, kEndLoopEntry);
        if (auto* windowing = entry<WindowingEntry>(module, kWindowingEntry))
            _loaded = _runLoop && _endLoop ? windowing() : nullptr;
    }
    if (!_loaded)
        kLog.error("loading the windows' module {}: {}", file->string(), std::string(dlerror()));
}

// A loop that was run before may have something due that its descriptor does not tell of yet.
int LoadedWindowing::drive(MainLoop& loop) const {
    DrivenLoop driven{loop, _endLoop, loop.dispatch()};
    if (driven.ended) return *driven.ended;
    _runLoop(loop.descriptor(), &DrivenLoop::dispatch, &driven);
    return driven.ended.value_or(EXIT_FAILURE);
}

LoadedWindowing& loadedWindowing() {
    static auto& service = *new LoadedWindowing(installedModules());
    return service;
}

Windowing& Platform::windowing() { return loadedWindowing(); }

}  // namespace vlm::platform
