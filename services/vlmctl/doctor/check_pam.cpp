#include <algorithm>
#include <array>
#include <initializer_list>
#include <string_view>

#include "platform/text.h"
#include "services/vlmctl/doctor/checks.h"
#include "services/vlmctl/doctor/pam_stack.h"

namespace vlm::control::doctor {

namespace {

using platform::text;
using Modules = std::vector<std::string>;

struct Service {
    std::string_view name;
    bool beginsASession = false;  // so that it should open the login keyring
};

// Who lets people in, as distributions name them: at a terminal, at a screen, and back at one.
constexpr std::array kServices = {
    Service{"login"},      Service{"gdm-password", true},   Service{"lightdm", true},
    Service{"sddm", true}, Service{"greetd", true},         Service{"xdm", true},
    Service{"kde"},        Service{"xscreensaver"},         Service{"i3lock"},
    Service{"swaylock"},   Service{"cinnamon-screensaver"}, Service{"mate-screensaver"},
};

constexpr const char* kEnable = "Let the logins ask for cards: \"pam-auth-update --enable vlm\".";

// Where the first of the modules stands; the end when none of them does.
std::size_t placeOf(const Modules& modules, std::initializer_list<std::string_view> names) {
    return static_cast<std::size_t>(std::ranges::find_first_of(modules, names) - modules.begin());
}

Finding checkStack(const Service& service, const Modules& modules) {
    const auto check = text("login:{}", service.name);
    const auto card = placeOf(modules, {"pam_vlm"});
    const auto password = placeOf(modules, {"pam_unix", "pam_sss", "pam_winbind", "pam_ldap"});
    const auto keyring = placeOf(modules, {"pam_gnome_keyring", "pam_kwallet5", "pam_kwallet"});
    if (card == modules.size()) return warning(check, "it asks for no card", kEnable);
    if (password < card)
        return problem(check, "it asks for the password before it asks for a card",
                       text("Put pam_vlm.so before the module that asks for the password, in "
                            "/etc/pam.d/{} or in what that includes.",
                            service.name));
    if (keyring < card)
        return problem(
            check, "it opens the keyring before it asks for a card",
            text("Put the keyring's module behind pam_vlm.so in /etc/pam.d/{}.", service.name));
    if (service.beginsASession && keyring == modules.size())
        return warning(check, "it asks for a card, and opens no keyring",
                       "Install libpam-gnome-keyring, or the module of the desktop's keyring.");
    return ok(check, "it asks for a card, and then for the password");
}

bool asksForCard(const MachineFiles& files, const Service& service) {
    const auto modules = authenticationModules(files, std::string(service.name));
    return modules && placeOf(*modules, {"pam_vlm"}) < modules->size();
}

}  // namespace

Findings checkPam(const Patient& patient) {
    const auto& files = patient.files;
    const auto module = files.firstOf(amongLibraries(files, "security/pam_vlm.so"));
    const bool isAsked = std::ranges::any_of(
        kServices, [&files](const auto& service) { return asksForCard(files, service); });
    if (!module)
        return {problem("pam-module", "the module that logs in with a card is not installed",
                        isAsked ? "Install this software again: logins fail while they ask for it."
                                : "Install this software again.")};
    Findings findings{ok("pam-module", *module)};
    if (!isAsked) {
        findings.push_back(problem("logins", "no login asks for a card", kEnable));
        return findings;
    }
    for (const auto& service : kServices)
        if (const auto modules = authenticationModules(files, std::string(service.name)))
            findings.push_back(checkStack(service, *modules));
    return findings;
}

}  // namespace vlm::control::doctor
