#pragma once

#include "../../SharedDependencies/Export.h"

#include <string>

namespace ZULMetaData {

/// Operations on a finished movie.
struct ZULMETADATA_API Util {
    /// Sets the size of the last atom in a movie that was not finished. Returns true if the atoms fill the file
    /// afterwards. An atom without a size that has 4 GiB or more needs the 8 spare bytes of a `wide` atom before it. It
    /// then gets the length that it had without them, which is 8 bytes less than its real length.
    static bool finalizeAtomsInFile(const std::string& path);

    /// Returns the last value in the stream of the scale factor, read as a 64-bit floating-point number, or 1.0 if
    /// there is none. The stream holds integers, so the result is meaningless; read it with
    /// `ScaleFactorMetaDataParser`.
    static double recordingScaleForMP4AtPath(const std::string& path);
};

} // namespace ZULMetaData
