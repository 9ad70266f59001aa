#pragma once

// The sound of an edited movie.

#include "Tools/zulm/FFmpeg.h"
#include "Tools/zulm/Media.h"
#include "ZULMetaDataSession/EditList.h"

#include <string>
#include <vector>

namespace Zulm {

/// Writes a sound as bare samples of 16 bits to a file, so many for each piece that all pieces begin at their times.
/// What is sped up keeps its pitch. Held frames are silent, and so is what lies beyond the end. Throws `Failure` and
/// `Interruption`.
void writeSound(const FFmpeg& ffmpeg, const CutSource& source, const SoundStream& sound,
                const std::vector<ZULMetaData::EditPiece>& pieces, const std::string& file);

/// Returns the options with which ffmpeg reads such a file.
Words soundInput(const SoundStream& sound, const std::string& file);

} // namespace Zulm
