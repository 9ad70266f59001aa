#include "Reports/Findings.h"

#include "Reports/Report.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <algorithm>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

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

Json findingDocument(const Finding& finding) {
    return {{"code", ruleOf(finding.code).name},
            {"severity", severityText(finding.severity())},
            {"place", finding.place},
            {"offset", finding.offset},
            {"message", finding.sentence}};
}

namespace {

Json findingDocuments(const std::vector<Finding>& findings) {
    Json documents = Json::array();
    for (const Finding& finding : findings)
        documents.push_back(findingDocument(finding));
    return documents;
}

Json verifiedStream(const StreamReport& stream) {
    return {{"kind", kindDocument(stream.type)},
            {"uuid", uuidText(stream.type)},
            {"version", stream.version},
            {"fixed_entry_size", stream.fixedEntrySize},
            {"offset", stream.offset},
            {"declared_bytes", stream.declaredBytes},
            {"present_bytes", stream.presentBytes},
            {"readable_bytes", stream.readableBytes},
            {"entries", stream.wholeEntries},
            {"first_time", numberDocument(stream.firstTime)},
            {"last_time", numberDocument(stream.lastTime)},
            {"reachable", stream.isReachable},
            {"findings", findingDocuments(stream.findings)}};
}

} // namespace

Json verifyDocument(const std::string& name, const ValidationReport& report) {
    Json document = fileHeader(name);
    document.update(Json{{"container", containerName(report.container)},
                         {"bytes", report.bytes},
                         {"duration", numberDocument(report.duration)},
                         {"damaged", report.isDamaged()},
                         {"damage_count", report.damageCount},
                         {"notice_count", report.noticeCount},
                         {"stream_count", report.streamCount},
                         {"entries", report.wholeEntries},
                         {"findings", findingDocuments(report.findings)},
                         {"streams", Json::array()}});
    for (const StreamReport& stream : report.streams)
        document["streams"].push_back(verifiedStream(stream));
    return document;
}

} // namespace Zulm
