#pragma once

// Captions as files that players and ffmpeg read.

#include "Tools/zulm/Captions.h"

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

/// How fine its times are.
double unitsPerSecond(CaptionFormat format);

/// A whole file. Texts are UTF-8; what would be markup in the format is escaped, or kept apart by a character that
/// does not show, and every text is one line.
std::string formatted(const std::vector<PlacedCaption>& captions, CaptionFormat format);

} // namespace Zulm
