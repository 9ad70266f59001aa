#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"

#include <utility>

namespace Zulm {

void printReport(const std::string& command, nlohmann::ordered_json files) {
    nlohmann::ordered_json report = reportHeader(command);
    report["files"] = std::move(files);
    writeOutput(reportText(report) + '\n');
}

} // namespace Zulm
