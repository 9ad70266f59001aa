#include "Reports/VerifyReport.h"

#include "Reports/Findings.h"
#include "Reports/Report.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

Json findingDocuments(const std::vector<Finding>& findings) {
    Json documents = Json::array();
    for (const Finding& finding : findings)
        documents.push_back(findingDocument(finding));
    return documents;
}

Json streamDocument(const StreamReport& stream) {
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
        document["streams"].push_back(streamDocument(stream));
    return document;
}

} // namespace Zulm
