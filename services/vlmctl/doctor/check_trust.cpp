#include "services/hints/owned_files.h"
#include "services/hints/tokens/module_registry.h"
#include "services/hints/trust_folder.h"
#include "services/vlmctl/doctor/checks.h"
#include "settings/smartcard_settings.h"

namespace vlm::control::doctor {

namespace {

using platform::String;

Finding checkAnchors(const std::string& folder) {
    const auto anchors = service::readOwnedFiles(folder + "/anchors", /*owner=*/0);
    const auto trustModules = service::configuredModules(service::ModuleFolders::ofThisMachine(),
                                                         service::ModuleKind::Trust);
    if (!anchors.contents.empty()) return ok("anchors", "there are some in " + folder);
    if (!trustModules.empty()) return ok("anchors", "those that this machine trusts for all");
    return problem("anchors", "checkCertificateTrust is on, and no issuer is trusted",
                   "Put the certificates of the cards' issuers into " + folder + "/anchors.");
}

}  // namespace

Findings checkTrust(const Patient& patient) {
    if (!patient.answers || VLGetSmartcardSetting(String("checkCertificateTrust")) == 0) return {};
    const std::string folder = service::TrustFolder::kUsualPath;
    Findings findings{checkAnchors(folder)};
    for (const auto* name : {"/anchors", "/intermediates", "/revoked"})
        for (const auto& words : service::readOwnedFiles(folder + name, /*owner=*/0).problems)
            findings.push_back(
                problem("trust-files", words,
                        "Let root own it and nobody else write it: \"chown root\", \"chmod "
                        "go-w\"."));
    return findings;
}

}  // namespace vlm::control::doctor
