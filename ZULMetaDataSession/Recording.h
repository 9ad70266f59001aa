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
#include "../ZULMetaDataBridge/Source/RecordingFile.h"
#include "Error.h"
#include "Track.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Opened once. Each stream is read at its first use, and only its own bytes. Any number of threads may use one object.
/// Every function throws `Error` if the file cannot be read.
class ZULMETADATA_API Recording {
public:
    /// Opens a movie, a RIFF file or a stream file; its contents say which. Throws `Error` if it cannot be opened or
    /// can hold no metadata.
    explicit Recording(const FileLocation& file);

    /// The same for bytes of the caller. Errors call them `name`. If the contents do not say what they are, the
    /// extension of `name` does.
    Recording(ByteSource bytes, const std::string& name);

    Recording(Recording&&) noexcept;
    Recording& operator=(Recording&&) noexcept;
    ~Recording();

    const std::string& name() const;        ///< what errors call it: the path, or the name of the caller's bytes
    Container::Type container() const;      ///< what the file is
    std::optional<double> duration() const; ///< returns what `movieDuration` does, in seconds

    const std::vector<StreamInfo>& streams() const;  ///< returns the streams that readers find
    std::vector<StreamReport> hiddenStreams() const; ///< returns the streams that the file holds and no reader finds
    std::vector<ZCAPHeader> creators() const;        ///< returns who made the recording, the newest last
    bool has(const uuid& kind) const;                ///< returns whether readers find a stream of this kind

    /// Returns the whole entries of a kind. The track is empty if there is no stream of it. It is read at the first
    /// call and kept. Throws `Error` if the header of the stream disagrees with its kind.
    template <RecordedKind Kind>
    const Track<Kind>& track() const;

    /// Calls `visit(time, value)` for each whole entry of a kind in the order of the stream, in bounded memory. An
    /// appearance of the cursor has the picture of its own entry alone. `visit` returns false to end the walk.
    template <RecordedKind Kind>
    void read(const Callback<bool(double time, const TrackValueOf<Kind>& value)>& visit) const;

    /// Returns the bytes of a stream as they are stored, header included. The recording must outlive them.
    ByteSource bytesOf(const StreamInfo& stream) const;

private:
    struct State;
    std::unique_ptr<State> state_;
};

} // namespace ZULMetaData
