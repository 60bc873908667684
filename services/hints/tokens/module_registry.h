// Which card modules this machine has: the .module files that pkcs11.conf(5) describes, read
// without loading any module. p11-kit itself would load them all into the asking process.

#pragma once

#include <string>
#include <vector>

namespace vlm::service {

struct ModuleFolders {
    // Where this machine's p11-kit looks, as it was when this was built.
    static ModuleFolders ofThisMachine();

    std::string packageFiles;  // what packages install
    std::string adminFiles;    // goes before a package's file of the same name, setting by setting
    std::string modules;       // a module that is named without a folder lies here
};

struct ConfiguredModule {
    std::string name;  // of its .module file, without the ending
    std::string path;  // of the module itself, links followed

    bool operator==(const ConfiguredModule&) const = default;
};

// What a module is for: one that holds trust anchors is no card's.
enum class ModuleKind { Card, Trust };

// The modules to load, most important first, each once. Modules that run elsewhere, that are of
// another kind or that are not meant for this program are left out. A file that is not well formed,
// or whose module is not there, is one line in the log; the others count all the same.
std::vector<ConfiguredModule> configuredModules(const ModuleFolders& folders,
                                                ModuleKind kind = ModuleKind::Card);

}  // namespace vlm::service
