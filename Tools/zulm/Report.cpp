#include "Tools/zulm/Report.h"

#include "Tools/zulm/Text.h"

#include <cmath>

namespace Zulm {

using Json = nlohmann::ordered_json;

Json reportHeader(const std::string& command) {
    return {{"schema", "zulm." + command}, {"schema_version", 1}, {"tool_version", ZULM_VERSION}};
}

std::string jsonLine(const Json& document) {
    return shownJSON(document.dump(-1, ' ', false, Json::error_handler_t::replace));
}

std::string reportText(const Json& document) {
    return shownJSON(document.dump(2, ' ', false, Json::error_handler_t::replace));
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

Json numberDocument(std::optional<double> number) {
    if (!number || std::isfinite(*number))
        return number ? Json(*number) : Json(nullptr);
    if (std::isnan(*number))
        return "NaN";
    return *number > 0 ? "Infinity" : "-Infinity";
}

} // namespace Zulm
