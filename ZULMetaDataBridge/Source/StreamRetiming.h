#pragma once

// Copies a stream for a movie that begins at another time than the recording did.
//
//     Retiming retiming;
//     retiming.shift = -2.5;
//     std::ofstream copy("shifted.dat", std::ios::binary);
//     retimeStream(StreamSource::file("cursorLocation.dat").open(), retiming, copy);

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ByteSource.h"
#include "../../ZULMetaData/ZULMMetaDataUUIDs.h"

#include <cstdint>
#include <optional>
#include <ostream>

namespace ZULMetaData {

/// How a copy differs from its original. The description of the machine has no time: it is copied as it is.
struct Retiming {
    double shift = 0; ///< seconds that are added to every time

    /// Removes the entries that lie before 0 or after so many seconds, and those whose time is not a number. What was
    /// in force at 0 (the last title, the last position, every picture of a cursor) stays, with the time 0.
    std::optional<double> trimmedTo;
};

/// What became of a stream.
struct RetimedStream {
    MetaDataHeader header;            ///< of the original; without a kind if the original is too short for one
    bool isReadable = true;           ///< false if nobody here knows where the times are: nothing was copied then
    std::uint64_t entries = 0;        ///< in the copy
    std::uint64_t entriesRemoved = 0; ///< by trimming
    std::uint64_t bytesLeftOut = 0;   ///< after the last whole entry
    std::optional<double> firstTime;  ///< the least finite time in the copy
    std::optional<double> lastTime;   ///< the greatest finite time in the copy
};

/// Appends the copy to `out`. Failures of `out` show in its state alone. Throws `std::system_error` if reading fails.
ZULMETADATA_API RetimedStream retimeStream(const ByteSource& stream, const Retiming& retiming, std::ostream& out);

/// The least and the greatest finite time in a stream, both empty if it has none or nobody here knows where times are.
struct TimeSpan {
    std::optional<double> first;    ///< in seconds
    std::optional<double> last;     ///< in seconds
    std::uint64_t entriesAfter = 0; ///< whose time is greater than the one that was asked for
};

/// Walks a whole stream. Throws `std::system_error` if reading fails.
ZULMETADATA_API TimeSpan timeSpanOf(const ByteSource& stream, double end);

} // namespace ZULMetaData
