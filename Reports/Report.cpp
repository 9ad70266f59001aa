#include "Reports/Report.h"

#include "Reports/Text.h"

#include <cmath>

namespace Zulm {

using Json = nlohmann::ordered_json;

void beginReport(JsonWriter& writer, const std::string& command) {
    writer.beginObject();
    writer.members({{"schema", "zulm." + command}, {"schema_version", 1}, {"tool_version", ZULM_VERSION}});
    writer.beginArray("files");
}

void endReport(JsonWriter& writer, const std::vector<ReportedError>& errors) {
    writer.endTo(1);
    writer.array("errors", errors, [](const ReportedError& error) {
        Json document = fileHeader(error.path);
        document["message"] = error.message;
        return document;
    });
    writer.endTo(0);
}

Json fileHeader(const std::string& path) {
    Json document;
    addText(document, "path", path);
    return document;
}

void addText(Json& document, const std::string& key, const std::string& bytes) {
    document[key] = validText(bytes);
    if (document[key] != bytes)
        document[key + "_base64"] = base64(bytes);
}

Json kindDocument(const ZULMetaData::uuid& type) {
    const ZULMetaData::MetaDataKind* kind = ZULMetaData::findMetaDataKind(type);
    return kind ? Json(kind->name) : Json(nullptr);
}

Json numberDocument(std::optional<double> number) {
    if (!number || std::isfinite(*number))
        return number ? Json(*number) : Json(nullptr);
    if (std::isnan(*number))
        return "NaN";
    return *number > 0 ? "Infinity" : "-Infinity";
}

} // namespace Zulm
