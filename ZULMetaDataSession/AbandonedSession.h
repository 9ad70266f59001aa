#pragma once

// What is left of a session whose process ended before its streams were in a movie.
//
//     for (const AbandonedSession& session : SessionWriter::abandoned("Videos"))
//         session.saveInto(session.folder() / "movie.mp4", "Recorder", "4.2");

#include "../Platform/FileLocation.h"
#include "../SharedDependencies/Export.h"
#include "../ZULMetaData/ZULMMetaDataCommon.h"
#include "../ZULMetaData/ZULMMetaDataUUIDs.h"
#include "../ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "Error.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace ZULMetaData {

/// What a stream file of a session holds.
struct SessionStream {
    uuid type{};                    ///< its kind
    FileLocation file;              ///< where it is
    std::uint64_t entries = 0;      ///< those that are whole
    std::uint64_t tornBytes = 0;    ///< what follows them, in bytes
    std::optional<double> lastTime; ///< of the last whole entry, in seconds; empty if there is none

    std::string name() const { return metaDataKindName(type); } ///< returns the name of its kind
};

/// What a session left in its folder. `SessionWriter::abandoned` finds such folders.
class ZULMETADATA_API AbandonedSession {
public:
    /// Looks into the folder of a session, even if it was saved before. Throws `Error` if there is no such folder, if a
    /// stream file cannot be read, and if the process of the session is alive.
    explicit AbandonedSession(const FileLocation& folder);

    const FileLocation& folder() const { return folder_; }                 ///< where it recorded
    const std::vector<SessionStream>& streams() const { return streams_; } ///< its stream files, in the order of kinds

    /// Returns the latest of the times of its streams, in seconds; nothing if it has no whole entry.
    std::optional<double> lastTime() const;

    /// Attaches the whole entries to a movie and stamps it, as `SessionWriter::saveInto` does. Afterwards the session
    /// is no longer abandoned. Throws `Error` and leaves the movie as it was if that fails.
    AttachResult saveInto(const FileLocation& movie, const std::string& creatorName = {},
                          const std::string& creatorVersion = {},
                          SafeMovieSave::FragmentIndex index = SafeMovieSave::FragmentIndex::Leave) const;

    /// Removes the stream files, the lock file, and the folder if it is empty then. Throws `Error` if something cannot
    /// be removed.
    void removeFiles() const;

private:
    FileLocation folder_;
    std::vector<SessionStream> streams_;
};

} // namespace ZULMetaData
