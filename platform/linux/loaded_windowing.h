// LoadedWindowing: windows by the toolkit of a module that is loaded with the first of them.
//
// The module is found from the program's own place only. Nothing in the environment can name
// another one; it would run its code in this program.

#pragma once

#include <filesystem>
#include <memory>
#include <vector>

#include "platform/linux/main_loop.h"
#include "platform/linux/windowing_module.h"

namespace vlm::platform {

class LoadedWindowing final : public Windowing {
public:
    // The files that are tried, in this order.
    explicit LoadedWindowing(std::vector<std::filesystem::path> modules)
        : _modules(std::move(modules)) {}

    std::unique_ptr<Window> loadWindow(std::string_view description) override;

    // Without a window there is nothing that could have the focus.
    void activateIgnoringOthers() override;

    bool isLoaded() const { return _loaded != nullptr; }

    // Lets the toolkit's loop drive this one, until this one ends; its status.
    int drive(MainLoop& loop) const;

private:
    void load();

    const std::vector<std::filesystem::path> _modules;

    // Of the module; they last as long as the process.
    Windowing* _loaded = nullptr;
    RunLoopEntry _runLoop = nullptr;
    EndLoopEntry _endLoop = nullptr;
};

// The windows of this process, for the program that runs the toolkit's loop.
LoadedWindowing& loadedWindowing();

}  // namespace vlm::platform
