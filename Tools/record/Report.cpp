#include "Tools/record/Report.h"

#include <nlohmann/json.hpp>

#include <cstdio>

namespace Recorder {

namespace {

nlohmann::ordered_json pathOrNull(const std::string& path) {
    return path.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(path);
}

} // namespace

void printReport(const Report& report) {
    nlohmann::ordered_json document{{"schema", "zulm.record"}, {"schema_version", 1}, {"tool_version", ZULM_VERSION}};
    document["movie"] = pathOrNull(report.movie);
    document["folder"] = pathOrNull(report.folder);
    document["duration"] = report.duration;
    document["frames"] = report.frames;
    document["dropped"] = report.dropped;
    document["entries"] = nlohmann::ordered_json::object();
    for (const auto& [kind, count] : report.entries)
        document["entries"][kind] = count;
    document["stopped_by"] = report.stoppedBy;
    const std::string text = document.dump(2, ' ', false, nlohmann::json::error_handler_t::replace) + "\n";
    std::fwrite(text.data(), 1, text.size(), stdout);
    std::fflush(stdout);
}

} // namespace Recorder
