#pragma once

// Keystrokes as captions and titles as chapters, placed on the time line of a recording.

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// Shown from `start` to `end`, in seconds.
struct Caption {
    double start = 0;
    double end = 0; ///< infinite where it is shown until the next one comes
    std::string text;
};

/// Returns the time before which every caption begins, in seconds: the end of the movie, or of what files can hold.
double endOfCaptions(std::optional<double> duration);

/// A caption in units of a time scale, as it stands in a file.
struct PlacedCaption {
    std::int64_t start = 0;
    std::int64_t end = 0;
    std::string text;
};

/// Captions in the order of their times, none overlapping the next and none empty. Those that begin together become
/// one. All of them must begin before `endOfCaptions(duration)`, and end there at the latest. A title that nothing
/// follows ends with the movie, or after a few seconds if the length of the movie is not known.
std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond, std::optional<double> duration);

} // namespace Zulm
