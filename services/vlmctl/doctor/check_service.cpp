#include "services/vlmctl/doctor/checks.h"

namespace vlm::control::doctor {

namespace {

constexpr const char* kReinstall = "Install this software again.";

Finding checkFile(const Patient& patient, const std::string& check, const std::string& words,
                  const std::vector<std::string>& paths) {
    if (const auto path = patient.files.firstOf(paths)) return ok(check, *path);
    return problem(check, words, kReinstall);
}

std::vector<std::string> unitPlaces(const std::string& kind, const std::string& unit) {
    auto places = installed("lib/systemd/" + kind + "/" + unit);
    places.push_back("/etc/systemd/" + kind + "/" + unit);
    places.push_back("/lib/systemd/" + kind + "/" + unit);
    return places;
}

std::vector<std::string> policyPlaces() {
    auto places = installed("share/dbus-1/system.d/org.vlm.token.hints.daemon.conf");
    places.push_back("/etc/dbus-1/system.d/org.vlm.token.hints.daemon.conf");
    return places;
}

// The daemon asks people for PINs on their desktop through it.
Finding checkInstanceOfUsers(const Patient& patient) {
    const bool isEnabled =
        patient.files
            .firstOf({"/etc/systemd/user/default.target.wants/vlmhintsd.service",
                      "/etc/systemd/user/graphical-session.target.wants/vlmhintsd.service",
                      "/usr/lib/systemd/user/default.target.wants/vlmhintsd.service"})
            .has_value();
    if (isEnabled) return ok("user-service", "it starts with each session");
    return warning("user-service",
                   "it does not start with sessions, so nobody is asked for a PIN "
                   "on the desktop, or told of an inserted card",
                   "Enable it: \"systemctl --global enable vlmhintsd.service\".");
}

Finding checkDaemon(const Answers& answers) {
    if (answers.pairings) return ok("daemon", "it answers");
    return problem("daemon", "it does not answer",
                   "\"systemctl status vlmhintsd\" and \"journalctl SUBSYSTEM=org.vlm.token\" say "
                   "why; after an installation, \"systemctl reload dbus\" makes it known.");
}

}  // namespace

Findings checkService(const Patient& patient) {
    Findings findings{
        checkFile(patient, "daemon-activation", "the bus cannot start the daemon",
                  installed("share/dbus-1/system-services/org.vlm.token.hints.daemon.service")),
        checkFile(patient, "daemon-unit", "systemd does not know the daemon",
                  unitPlaces("system", "vlmhintsd.service")),
        checkFile(patient, "bus-policy", "the bus lets the daemon have no name", policyPlaces()),
        checkFile(patient, "user-activation", "the session bus cannot start the user's instance",
                  installed("share/dbus-1/services/org.vlm.token.hints.agent.service")),
        checkInstanceOfUsers(patient)};
    if (patient.answers) findings.push_back(checkDaemon(*patient.answers));
    return findings;
}

}  // namespace vlm::control::doctor
