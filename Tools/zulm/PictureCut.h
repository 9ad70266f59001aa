#pragma once

// The pictures of an edited movie, each piece in a file of its own.

#include "Tools/zulm/FFmpeg.h"
#include "Tools/zulm/Media.h"
#include "ZULMetaDataSession/EditList.h"

#include <functional>
#include <string>
#include <vector>

namespace Zulm {

/// The pictures of a piece.
struct PictureFile {
    std::string name; ///< in the folder
    ZULMetaData::EditPiece piece;
};

/// What is cut and where the files go.
struct PictureCut {
    const FFmpeg& ffmpeg;
    const CutSource& source;
    const PictureStream& pictures;
    std::string folder;
    std::string container; ///< of the new movie, as ffmpeg calls it: "mp4" or "mov"
    std::function<void(const ZULMetaData::Rational& edited)> progress; ///< called with seconds of the new movie
};

/// Units of time in files of pictures that are encoded again: they fit the usual frame rates, and the times of other
/// frames within 6 microseconds.
inline constexpr int s_ticksPerSecond = 90000;

/// Encodes the pictures again, so that every piece begins where it should: with the frame that is shown then.
std::vector<PictureFile> encodedPieces(const PictureCut& cut, const ZULMetaData::EditList& edits);

/// Copies the pictures, from a key frame at or before the start of a piece to its end or a little after it. Returns the
/// pieces as they are in the files. Throws `Failure` for speeds and held frames.
std::vector<PictureFile> copiedPieces(const PictureCut& cut, const ZULMetaData::EditList& edits);

/// Returns whether two times are the same but for units in which they were rounded.
bool areSameTimes(const ZULMetaData::Rational& left, const ZULMetaData::Rational& right);

} // namespace Zulm
