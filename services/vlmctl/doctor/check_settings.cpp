#include "platform/text.h"
#include "services/vlmctl/doctor/checks.h"
#include "settings/smartcard_settings.h"

namespace vlm::control::doctor {

namespace {

using platform::String;
using platform::text;

bool isOn(const char* key) { return VLGetSmartcardSetting(String(key)) != 0; }

Finding checkEnforcement(const Patient& patient) {
    if (!isOn("enforceSmartCard")) return ok("enforcement", "logins without a card are allowed");
    if (!isOn("allowSmartCard"))
        return problem("enforcement",
                       "enforceSmartCard is on and allowSmartCard is off, so nobody can log in",
                       "Do one of these: \"vlmctl set allowSmartCard on\", \"vlmctl set "
                       "enforceSmartCard off\".");
    const bool hasNone = patient.answers && patient.answers->pairings == std::size_t{0};
    // Root logs in to mend the machine, as a rule without a card.
    if (!hasNone || patient.isRoot) return ok("enforcement", "a card is needed to log in");
    if (isOn("allowUnmappedUsers"))
        return ok("enforcement",
                  text("a card is needed by who is paired; {} is not", patient.account));
    return problem("enforcement",
                   text("a card is needed to log in, and {} is paired with none", patient.account),
                   "Pair a card before logging out; or \"vlmctl set allowUnmappedUsers on\".");
}

}  // namespace

// The settings are this machine's; a disk in a folder has others.
Findings checkSettings(const Patient& patient) {
    if (!patient.answers) return {};
    Findings findings{checkEnforcement(patient)};
    if (!isOn("allowSmartCard"))
        findings.push_back(warning("cards", "cards are not used for logins: allowSmartCard is off",
                                   "If they shall be: \"vlmctl set allowSmartCard on\"."));
    return findings;
}

}  // namespace vlm::control::doctor
