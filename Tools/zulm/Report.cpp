#include "Tools/zulm/Report.h"

#include <fmt/core.h>

namespace Zulm {

void printReport(const std::string& command, nlohmann::ordered_json files) {
    using Json = nlohmann::ordered_json;
    const Json report{{"schema", "zulm." + command},
                      {"schema_version", 1},
                      {"tool_version", ZULM_VERSION},
                      {"files", std::move(files)}};
    fmt::print("{}\n", report.dump(2, ' ', false, Json::error_handler_t::replace));
}

} // namespace Zulm
