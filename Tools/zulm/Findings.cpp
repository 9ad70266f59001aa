#include "Tools/zulm/Findings.h"

#include <fmt/core.h>

namespace Zulm {

using namespace ZULMetaData;

const char* severityText(Severity severity) {
    return severity == Severity::Notice ? "notice" : "damage";
}

std::string findingText(const Finding& finding) {
    const bool isNotice = finding.severity() == Severity::Notice;
    return fmt::format("{} at offset {}: {}{} [{}]", finding.place, finding.offset, isNotice ? "notice: " : "",
                       finding.sentence, ruleOf(finding.code).name);
}

nlohmann::ordered_json findingDocument(const Finding& finding) {
    return {{"code", ruleOf(finding.code).name},
            {"severity", severityText(finding.severity())},
            {"place", finding.place},
            {"offset", finding.offset},
            {"message", finding.sentence}};
}

} // namespace Zulm
