// LoadedWindowing: windows by the toolkit of a module that is loaded with the first of them.
//
// The module is found from the program's own place only. Nothing in the environment can name
// another one; it would run its code in this program.

#pragma once

#include <filesystem>
#include <memory>
#include <vector>

#include "platform/windowing.h"

namespace vlm::platform {

class LoadedWindowing final : public Windowing {
public:
    // The files that are tried, in this order.
    explicit LoadedWindowing(std::vector<std::filesystem::path> modules)
        : _modules(std::move(modules)) {}

    std::unique_ptr<Window> loadWindow(std::string_view description) override;

    // Without a window there is nothing that could have the focus.
    void activateIgnoringOthers() override;

private:
    Windowing* loadModule() const;

    const std::vector<std::filesystem::path> _modules;
    Windowing* _loaded = nullptr;  // lives as long as the process
};

}  // namespace vlm::platform
