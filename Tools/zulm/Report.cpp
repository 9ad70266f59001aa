#include "Tools/zulm/Report.h"

#include "Tools/zulm/Text.h"

#include <cmath>

namespace Zulm {

using Json = nlohmann::ordered_json;

Json reportHeader(const std::string& command) {
    return {{"schema", "zulm." + command}, {"schema_version", 1}, {"tool_version", ZULM_VERSION}};
}

std::string reportText(const Json& document) {
    return document.dump(2, ' ', false, Json::error_handler_t::replace);
}

Json fileHeader(const std::string& path) {
    const std::string valid = validText(path);
    Json document{{"path", valid}};
    if (valid != path)
        document["path_base64"] = base64(path);
    return document;
}

Json numberDocument(std::optional<double> number) {
    if (!number || std::isfinite(*number))
        return number ? Json(*number) : Json(nullptr);
    if (std::isnan(*number))
        return "NaN";
    return *number > 0 ? "Infinity" : "-Infinity";
}

} // namespace Zulm
