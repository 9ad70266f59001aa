#pragma once

// Makes the movie of an edit list with ffmpeg.

#include "ZULMetaDataSession/EditList.h"

#include <string>

namespace Zulm {

class InputFile;

/// How the pictures get into the new movie.
enum class CutMode {
    Exact, ///< encoded again, so that every piece begins where it should
    Fast,  ///< copied, so that every piece begins at a key frame
};

/// Writes the movie to the file `output`, which `name` is the future name of, and works in a folder next to it. Returns
/// the pieces that the movie is made of: the edits, or for a fast cut what was found in the movie afterwards. Warns of
/// streams that are left out. Throws `Failure`, and `Interruption` if a signal was noted.
ZULMetaData::EditList cutMovie(const InputFile& source, const ZULMetaData::EditList& edits, CutMode mode,
                               const std::string& output, const std::string& name);

} // namespace Zulm
