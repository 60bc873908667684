// Looks at everything that a login with a card needs, and says what to do about what is missing.

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdlib>
#include <string>

#include "platform/platform.h"
#include "platform/process_info.h"
#include "platform/text.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/doctor/checks.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"

namespace vlm::control {

namespace {

using doctor::Finding;
using doctor::Findings;
using doctor::Patient;
using doctor::Verdict;
using platform::text;

constexpr std::array kChecks = {
    doctor::checkClock,   doctor::checkReaders,  doctor::checkModules,
    doctor::checkService, doctor::checkDesktop,  doctor::checkPam,
    doctor::checkKeyring, doctor::checkSettings, doctor::checkTrust,
};

std::string_view nameOf(Verdict verdict) {
    switch (verdict) {
        case Verdict::Ok:
            return "ok";
        case Verdict::Warning:
            return "warning";
        case Verdict::Problem:
            return "problem";
    }
    return "problem";
}

std::int64_t secondsNow() {
    const auto since = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::seconds>(since).count();
}

std::string fromEnvironment(const char* name) {
    const char* value = std::getenv(name);
    return value ? value : "";
}

Patient patientOf(const Arguments& arguments) {
    const auto& process = platform::current().processInfo();
    Patient patient{.files = doctor::MachineFiles(arguments.root.value_or("")),
                    .answers = std::nullopt,
                    .account = process.ownerUserName(),
                    .isRoot = process.effectiveUserId() == 0,
                    .runtimeFolder = fromEnvironment("XDG_RUNTIME_DIR"),
                    .now = secondsNow()};
    if (!arguments.root) patient.answers = doctor::askAround(patient.account);
    return patient;
}

void printLines(const Findings& findings, Output& output) {
    for (const auto& finding : findings) {
        auto verdict = std::string(nameOf(finding.verdict));
        verdict.resize(8, ' ');
        output.print(text("{} {}: {}", verdict, finding.check, finding.words));
        if (!finding.remedy.empty()) output.print("         " + finding.remedy);
    }
}

Json jsonOf(const Findings& findings) {
    Json::Array list;
    for (const auto& finding : findings)
        list.emplace_back(
            Json::Object{{"check", finding.check},
                         {"verdict", nameOf(finding.verdict)},
                         {"words", finding.words},
                         {"remedy", finding.remedy.empty() ? Json() : Json(finding.remedy)}});
    return Json::Object{{"checks", std::move(list)}};
}

}  // namespace

int examine(const Arguments& arguments, Output& output) {
    const auto patient = patientOf(arguments);
    Findings findings;
    for (const auto check : kChecks)
        for (auto& finding : check(patient)) findings.push_back(std::move(finding));
    if (arguments.json) {
        output.print(jsonOf(findings).text());
    } else {
        printLines(findings, output);
    }
    const bool isIll = std::ranges::count(findings, Verdict::Problem, &Finding::verdict) > 0;
    return isIll ? kExitFailure : kExitSuccess;
}

}  // namespace vlm::control
