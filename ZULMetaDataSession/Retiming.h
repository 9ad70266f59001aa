#pragma once

// The streams of a recording for a movie that was cut out of it.
//
//     const Recording recording("Recording.mp4");
//     EditList edits;
//     edits.keep({10}, {20}, {2}); // ten seconds, twice as fast
//     for (const EditedStream& stream : retimed(recording, edits).streams)
//         std::cout << stream.source.name() << ": " << stream.counts.moved << " entries moved\n";

#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "../ZULMetaData/ByteSource.h"
#include "EditList.h"
#include "Recording.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// What became of the entries of a stream. A stream that was copied has zeros.
struct RetimedCounts {
    std::uint64_t moved = 0;   ///< entries of pieces, at their new times; an entry of two pieces counts twice
    std::uint64_t carried = 0; ///< what held already at the beginning of a piece or in a held frame, written there
    std::uint64_t added = 0;   ///< presses and releases of buttons that are down at an edge
    std::uint64_t leftOut = 0; ///< entries of the recording whose time is not finite

    std::uint64_t written() const { return moved + carried + added; } ///< returns the number of entries in the result
};

/// A stream for the edited movie.
struct EditedStream {
    StreamInfo source;     ///< the stream of the recording
    bool isCopied = false; ///< whether it is the same bytes: its kind is valid at all times, or is not known here
    RetimedCounts counts;  ///< what became of its entries

    /// All of it, header included, unless the bytes went to a function of the caller.
    ByteSource bytes = ByteSource::memory({});
    std::uint64_t offset = 0; ///< where the stream begins in what that function was called with
    std::uint64_t size = 0;   ///< in bytes
};

/// All streams for the edited movie, and what should be known about them.
struct EditedRecording {
    std::vector<EditedStream> streams; ///< in the order of the recording's

    /// Sentences about streams that were copied because they are not known here, and about hidden streams, which were
    /// left out. They do not name the recording.
    std::vector<std::string> warnings;

    /// Sentences about what was lost: entries without a finite time, and what follows a damaged entry.
    std::vector<std::string> losses;
};

/// Moves the entries of every stream to the time line of the edited movie.
///
/// A state that holds at the beginning of a piece or in a held frame is written there, unless it is what the stream
/// says already. An event is written once for every piece that it lies in. Buttons that are down at an edge are
/// released or pressed there, but not if the next piece goes on where this one ends. Pictures of cursors are stored
/// with their first use. Kinds that are valid at all times and streams that are not known here are copied.
///
/// The streams are made in memory, and those that are copied refer to the recording's bytes. Throws `Error` if the
/// recording cannot be read.
ZULMETADATA_API EditedRecording retimed(const Recording& recording, const EditList& edits);

/// The same in bounded memory: calls `sink` with the bytes of the streams that are not copied, one after the other.
/// What the sink throws passes through.
ZULMETADATA_API EditedRecording retimed(const Recording& recording, const EditList& edits,
                                        const Callback<void(std::string_view bytes)>& sink);

} // namespace ZULMetaData
