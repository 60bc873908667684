#include "platform/text.h"
#include "services/vlmctl/doctor/checks.h"
#include "services/vlmctl/shown.h"

namespace vlm::control::doctor {

namespace {

using platform::text;

Finding checkPcscd(const Patient& patient) {
    const auto program = patient.files.firstOf({"/usr/sbin/pcscd", "/usr/local/sbin/pcscd"});
    const bool hasSocket = patient.files.has("/run/pcscd/pcscd.comm");
    if (!program && !hasSocket)
        return problem("pcscd", "the service that reads smart cards is not installed",
                       "Install pcscd.");
    if (!patient.answers) return ok("pcscd", "it is installed");
    if (patient.answers->readers) return ok("pcscd", "it answers");
    if (!hasSocket)
        return problem("pcscd", "it is not running",
                       "Start it: \"systemctl enable --now pcscd.socket\".");
    return problem("pcscd", "it does not serve this user, or hangs",
                   "\"journalctl -u pcscd\" says why; where polkit rules over cards, this user's "
                   "session needs the right.");
}

Finding checkReader(const std::vector<std::string>& readers) {
    if (readers.empty())
        return warning("readers", "no reader is connected",
                       "Connect one; if there is one, install its driver (libccid, as a rule).");
    std::string names;
    for (const auto& name : readers) names += (names.empty() ? "" : ", ") + shown(name);
    return ok("readers", names);
}

// A card holds certificates for other purposes, too; one that is good for a login is enough.
Finding checkCertificates(const Card& card) {
    if (card.identities == 0)
        return warning("certificate", text("\"{}\" holds none with a key", shown(card.name)),
                       "Have one put on it by who issues the cards.");
    return warning("certificate",
                   text("none on \"{}\" is in its dates and may sign", shown(card.name)),
                   "Check the clock; or have the card renewed.");
}

Findings checkCards(const std::vector<Card>& cards) {
    if (cards.empty())
        return {warning("card", "no card is seen",
                        "Insert one; if there is one, no card module knows it: see \"journalctl "
                        "SUBSYSTEM=org.vlm.token\".")};
    Findings findings;
    for (const auto& card : cards) {
        findings.push_back(ok("card", shown(card.name)));
        if (card.usable == 0) findings.push_back(checkCertificates(card));
    }
    return findings;
}

}  // namespace

Findings checkReaders(const Patient& patient) {
    Findings findings{checkPcscd(patient)};
    if (!patient.answers) return findings;
    if (patient.answers->readers) findings.push_back(checkReader(*patient.answers->readers));
    if (patient.answers->cards)
        for (auto& finding : checkCards(*patient.answers->cards))
            findings.push_back(std::move(finding));
    return findings;
}

}  // namespace vlm::control::doctor
