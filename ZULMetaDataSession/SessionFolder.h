#pragma once

// The folder of a session: the names of its files, what they hold, and what becomes of them.

#include "Platform/FileLocation.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataBridge/Source/StreamSource.h"
#include "ZULMetaDataSession/AbandonedSession.h"

#include <array>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

/// How the stream of a kind is stored.
struct StreamFormat {
    MetaDataHeader header;
    std::optional<double> (*timeOf)(std::string_view entry, int version) = nullptr; ///< returns the time of an entry

    std::string name() const { return metaDataKindName(header.uuid); }
    FileLocation fileIn(const FileLocation& folder) const { return folder / (name() + ".dat"); }
};

/// The formats of all kinds, in the order of `RecordedKinds`.
const std::array<StreamFormat, RecordedKinds::size>& streamFormats();

/// Returns the file that is locked as long as the session is alive.
FileLocation lockFileIn(const FileLocation& folder);

/// Throws `Error` if the folder holds files of a session.
void requireFree(const FileLocation& folder);

/// Returns what the stream files in the folder hold, in the order of `RecordedKinds`. Throws `Error` if one cannot be
/// read.
std::vector<SessionStream> streamsIn(const FileLocation& folder);

/// Returns the streams with at least one whole entry.
std::vector<StreamSource> sourcesIn(const FileLocation& folder);

/// Attaches the streams in the folder to a movie and stamps it. Throws `Error` and leaves the movie as it was.
AttachResult saveFolder(const FileLocation& folder, const FileLocation& movie, const std::string& creatorName,
                        const std::string& creatorVersion, SafeMovieSave::FragmentIndex index);

/// Removes the files of the session, and the folder if nothing else is in it. Throws `Error`.
void removeSession(const FileLocation& folder);

} // namespace ZULMetaData::detail
