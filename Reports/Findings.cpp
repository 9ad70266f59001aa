#include "Reports/Findings.h"

#include <fmt/core.h>

#include <algorithm>

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

std::string damageIn(const StreamReport& stream) {
    if (stream.readableBytes == 0)
        return "it could not be examined";
    const auto isDamage = [](const Finding& finding) { return finding.severity() == Severity::Damage; };
    const auto first = std::find_if(stream.findings.begin(), stream.findings.end(), isDamage);
    if (first == stream.findings.end())
        return {};
    const auto others = std::count_if(stream.findings.begin(), stream.findings.end(), isDamage) - 1;
    return fmt::format("at offset {}: {}{}", first->offset, first->sentence,
                       others == 0 ? std::string() : fmt::format(" ({} more)", others));
}

nlohmann::ordered_json findingDocument(const Finding& finding) {
    return {{"code", ruleOf(finding.code).name},
            {"severity", severityText(finding.severity())},
            {"place", finding.place},
            {"offset", finding.offset},
            {"message", finding.sentence}};
}

} // namespace Zulm
