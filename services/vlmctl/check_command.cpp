// The check of a property list that is, or is to become, one of this system's files.

#include <string>
#include <string_view>

#include "platform/property_list.h"
#include "platform/text.h"
#include "services/vlmctl/commands.h"
#include "services/vlmctl/exit_status.h"
#include "services/vlmctl/json.h"
#include "services/vlmctl/property_list_check.h"
#include "services/vlmctl/read_file.h"
#include "services/vlmctl/shown.h"

namespace vlm::control {

namespace {

using platform::PropertyListFormat;
using platform::text;

struct FormatName {
    std::string_view forPeople;
    std::string_view inJson;
};

FormatName nameOf(PropertyListFormat format) {
    switch (format) {
        case PropertyListFormat::Binary:
            return {"binary property list", "binary"};
        case PropertyListFormat::Xml:
            return {"XML property list", "xml"};
        case PropertyListFormat::Text:
            return {"text property list", "text"};
    }
    return {"property list", "unknown"};
}

std::string placeOf(const std::string& file, const Finding& finding) {
    return finding.line == 0 ? file : text("{}:{}:{}", file, finding.line, finding.column);
}

void printReport(const CheckReport& report, const std::string& file, Output& output) {
    for (const auto& finding : report.findings)
        output.print(shown(text("{}: {}{}", placeOf(file, finding),
                                finding.isWarning ? "warning: " : "", finding.text)));
    if (!report.hasProblems())
        output.print(shown(text("{}: {}, {} {}, no problems", file, nameOf(report.format).forPeople,
                                report.keys, report.keys == 1 ? "key" : "keys")));
}

Json jsonOf(const CheckReport& report, const std::string& file) {
    Json::Array findings;
    for (const auto& finding : report.findings) {
        const bool hasPlace = finding.line != 0;
        findings.emplace_back(Json::Object{{"severity", finding.isWarning ? "warning" : "problem"},
                                           {"line", hasPlace ? Json(finding.line) : Json()},
                                           {"column", hasPlace ? Json(finding.column) : Json()},
                                           {"text", finding.text}});
    }
    return Json::Object{{"file", file},
                        {"format", nameOf(report.format).inJson},
                        {"ok", !report.hasProblems()},
                        {"keys", report.keys},
                        {"findings", std::move(findings)}};
}

}  // namespace

int checkFile(const Arguments& arguments, Output& output) {
    const auto& file = arguments.operands.front();
    const auto role = roleOf(file);
    const auto most = mostBytes(role);
    const auto content = file == "-" ? readStandardInput(most) : readFile(file, most);
    if (!content.bytes) {
        output.complain(text("{} cannot be read: {}", file, content.problem));
        return kExitUsage;
    }

    const auto report = checkPropertyList(*content.bytes, role);
    if (arguments.json) {
        output.print(jsonOf(report, file).text());
    } else {
        printReport(report, file, output);
    }
    return report.hasProblems() ? kExitFailure : kExitSuccess;
}

}  // namespace vlm::control
