#include "services/vlmctl/doctor/checks.h"

namespace vlm::control::doctor {

// What the pairing window, and the question for an administrator, are made of.
Findings checkDesktop(const Patient& patient) {
    const auto check = [&patient](const std::string& name, const std::string& words,
                                  const std::vector<std::string>& paths) {
        if (const auto path = patient.files.firstOf(paths)) return ok(name, *path);
        return problem(name, words, "Install this software again.");
    };
    return {
        check("polkit", "polkit does not know the right to pair",
              {"/usr/share/polkit-1/actions/org.vlm.vlmbind.policy"}),
        check("sandbox", "the profile that confines vlmbind is missing, and vlmbind will not run",
              installed("share/vlm/sandbox/org.vlm.vlmbind.profile")),
        check("window", "the module that shows the pairing window is missing",
              amongLibraries(patient.files, "vlm/vlm_qt_windowing.so")),
        check("window-layout", "the layout of the pairing window is missing",
              installed("share/vlm/ui/BindDialog.ui"))};
}

}  // namespace vlm::control::doctor
