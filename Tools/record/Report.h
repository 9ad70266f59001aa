#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace Recorder {

/// What was recorded, as `--json` prints it.
struct Report {
    std::string movie;  ///< empty if there is none
    std::string folder; ///< empty if it was removed
    double duration = 0;
    std::uint64_t frames = 0;
    std::uint64_t dropped = 0;
    std::vector<std::pair<std::string, std::uint64_t>> entries; ///< by the names of kinds
    std::string stoppedBy;
};

/// Prints the document "zulm.record" on standard output.
void printReport(const Report& report);

} // namespace Recorder
