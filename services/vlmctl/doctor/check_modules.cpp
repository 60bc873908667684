#include "services/hints/tokens/module_registry.h"
#include "services/vlmctl/doctor/checks.h"
#include "services/vlmctl/shown.h"

namespace vlm::control::doctor {

using service::ModuleFolders;

// No module is loaded here: they are foreign code, and the hints service keeps them apart.
Findings checkModules(const Patient& patient) {
    auto folders = ModuleFolders::ofThisMachine();
    for (auto* folder : {&folders.packageFiles, &folders.adminFiles, &folders.modules})
        folder->insert(0, patient.files.root());
    const auto modules = service::configuredModules(folders);
    if (modules.empty())
        return {problem("modules", "no card module is configured",
                        "Install one for the cards that are used, opensc-pkcs11 for instance; "
                        "pkcs11.conf(5) says how modules are configured.")};
    std::string names;
    for (const auto& module : modules) names += (names.empty() ? "" : ", ") + shown(module.name);
    return {ok("modules", names)};
}

}  // namespace vlm::control::doctor
