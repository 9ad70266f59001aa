#pragma once

#include "Tools/record/Instant.h"

#include <cstdint>
#include <string>

namespace Recorder {

/// How a recording goes.
struct Progress {
    bool isPaused = false;
    double seconds = 0;
    std::uint64_t frames = 0;
    std::uint64_t dropped = 0;
    std::uint64_t entries = 0;
    std::uint64_t movieBytes = 0;
    std::uint64_t streamBytes = 0;
};

/// What the user reads on standard error: sentences, and on a terminal one line that changes.
class StatusLine {
public:
    /// Returns whether the line is to be shown again.
    bool isDue() const;

    void show(const Progress& progress);

    /// Leaves what is shown as it is. The next text begins a line.
    void end();

    /// Writes a line of its own.
    void say(const std::string& line);

private:
    Instant next_ = 0;
    bool isShown_ = false;
};

/// Writes a line to standard error.
void say(const std::string& line);

} // namespace Recorder
