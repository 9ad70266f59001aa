#pragma once

// A recording as editors use it: its tracks, and what holds at any time.
//
//     const Recording recording("Recording.mp4");
//     for (const auto& title = recording.track<TopmostWindowTitleKind>(); const std::string& text : title.values())
//         std::cout << text << '\n';

#include "../Platform/FileLocation.h"
#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "../SharedDependencies/ZCAPHeader.h"
#include "../ZULMetaData/ByteSource.h"
#include "../ZULMetaData/StreamEntries.h"
#include "../ZULMetaDataBridge/Source/RecordingFile.h"
#include "Error.h"
#include "Snapshot.h"
#include "Track.h"

#include <cstddef>
#include <list>
#include <memory>
#include <optional>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZULMetaData {

namespace detail {

/// A track of every kind that is recorded.
using Tracks = TracksOf<RecordedKinds>::Type;

class RecordingStates;

} // namespace detail

/// Opened once. Each stream is read at its first use, and only its own bytes. Any number of threads may use one object.
/// Every function throws `Error` if the file cannot be read.
class ZULMETADATA_API Recording {
public:
    /// Opens a movie, a RIFF file or a stream file; its contents say which. Throws `Error` if it cannot be opened or
    /// can hold no metadata.
    explicit Recording(const FileLocation& file);

    /// The same for bytes of the caller. Errors call them `name`. If the contents do not say what they are, the
    /// extension of `name` does. The bytes are read by one thread at a time.
    Recording(ByteSource bytes, const std::string& name);

    Recording(Recording&&) noexcept;            ///< takes the recording over; the other one must not be used any more
    Recording& operator=(Recording&&) noexcept; ///< the same; closes what was open before
    ~Recording();

    const std::string& name() const;        ///< what errors call it: the path, or the name of the caller's bytes
    Container::Type container() const;      ///< what the file is
    std::optional<double> duration() const; ///< returns what `movieDuration` does, in seconds

    const std::vector<StreamInfo>& streams() const;  ///< returns the streams that readers find
    std::vector<StreamReport> hiddenStreams() const; ///< returns the streams that the file holds and no reader finds
    bool hidesStreams() const;                       ///< returns whether damage may keep readers from finding streams
    std::vector<ZCAPHeader> creators() const;        ///< returns who made the recording, the newest last
    bool has(const uuid& kind) const;                ///< returns whether readers find a stream of this kind

    /// Returns the whole entries of a kind. The track is empty if there is no stream of it. It is read at the first
    /// call and kept. Throws `Error` if the header of the stream disagrees with its kind.
    template <RecordedKind Kind>
    const Track<Kind>& track() const {
        return std::get<Track<Kind>>(tracksWith(detail::TracksOf<RecordedKinds>::placeOf<Kind>()));
    }

    /// Calls `visit(time, value)` for each whole entry of a kind in the order of the stream, in bounded memory. An
    /// appearance of the cursor has the picture of its own entry alone. `visit` returns false to end the walk.
    template <RecordedKind Kind>
    void read(const Callback<bool(double time, const TrackValueOf<Kind>& value)>& visit) const;

    /// Returns everything that holds at a time. The recording must outlive its texts. Reads all tracks that a snapshot
    /// shows at the first call. Throws `Error` if the header of one of them disagrees with its kind; a `Timeline` can
    /// leave such a stream out.
    Snapshot at(double time, Interpolation interpolation = Interpolation::Linear) const;

    /// Returns what of the screen was recorded.
    RecordedArea area() const;

    /// Returns the bytes of a stream as they are stored, header included. Any number of threads may read them, and they
    /// stay valid without the recording. Reading throws `Error`.
    ByteSource bytesOf(const StreamInfo& stream) const;

private:
    friend class Timeline;

    struct State;

    /// Returns what all snapshots share, and prepares it at the first call.
    const std::shared_ptr<const detail::RecordingStates>& states() const;

    /// Returns all tracks. Reads the one at this place at the first call.
    const detail::Tracks& tracksWith(std::size_t place) const;

    const StreamInfo* find(const uuid& kind) const;

    /// Returns the bytes of the stream of a kind, or no bytes if there is none. Throws `Error` if its header disagrees
    /// with its kind.
    ByteSource decodableBytesOf(const uuid& kind) const;

    std::unique_ptr<State> state_;
};

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

/// Calls `visit(time, value)` for the whole entries of a stream until it returns false, or an entry does not fit its
/// kind. The time of a list is 0.
template <RecordedKind Kind, class Visit>
void visitEntries(const ByteSource& stream, Visit visit) {
    using Stored = typename Kind::Value;
    StreamEntries entries(stream);
    while (const auto entry = entries.next()) {
        if constexpr (std::is_same_v<Stored, CursorImage>)
            if (!hasRoomForCursorFields(entries.bytesOf(*entry), entries.header()->version))
                return;
        auto decoded = decodeEntry<Stored>(entries.bytesOf(*entry), entries.header()->version);
        if (!decoded)
            return;
        const double time = std::is_same_v<Stored, std::list<std::string>> ? 0 : decoded->time;
        if constexpr (std::is_same_v<Stored, TrackValueOf<Kind>>) {
            if (!visit(time, std::move(decoded->value)))
                return;
        } else if (!visit(time, trackValue(decoded->value))) {
            return;
        }
    }
}

} // namespace detail

template <RecordedKind Kind>
void Recording::read(const Callback<bool(double time, const TrackValueOf<Kind>& value)>& visit) const {
    detail::visitEntries<Kind>(decodableBytesOf(Kind::type), visit);
}

} // namespace ZULMetaData
