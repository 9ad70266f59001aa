#pragma once

// Keystrokes as captions and titles as chapters, in the files that players and ffmpeg read.

#include <optional>
#include <string>
#include <vector>

namespace Zulm {

enum class CaptionFormat {
    SRT,        ///< SubRip
    VTT,        ///< WebVTT
    ASS,        ///< Advanced SubStation Alpha
    FFMetaData, ///< chapters, as ffmpeg reads and writes them
    Chapters,   ///< CHAPTER01=..., as muxers and players read them
};

/// Whether it holds chapters, not captions.
bool holdsChapters(CaptionFormat format);

/// Shown from `start` to `end`, in seconds.
struct Caption {
    double start = 0;
    double end = 0; ///< infinite where it is shown until the next one comes
    std::string text;
};

/// Returns the time before which every caption begins, in seconds: the end of the movie, or of what files can hold.
double endOfCaptions(std::optional<double> duration);

/// Returns a whole file. All captions must begin before `endOfCaptions(duration)`, and end there at the latest. Those
/// that begin together become one, and none overlaps the next. Texts are UTF-8; what would be markup in the format is
/// escaped, or kept apart by a character that does not show, and every text is one line.
std::string formatted(std::vector<Caption> captions, CaptionFormat format, std::optional<double> duration);

} // namespace Zulm
