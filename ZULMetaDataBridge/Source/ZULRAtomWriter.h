#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"
#include "../../SharedDependencies/ZCAPHeader.h"

#include <string>

namespace ZULMetaData {

/// Stamps a movie in the way that recorders rely on. New code should use `SafeMovieSave::stamp`, which is safe.
class ZULMETADATA_API ZULRAtomWriter {
public:
    /// Repairs the last atom of the movie and appends a `ZULR` atom of 80 bytes: its header, then a `ZCAPHeader` of
    /// version 1. Every call appends another atom.
    ///
    /// `creatorName` is not stored: the name is always that of the platform, by which readers tell platforms apart. If
    /// the movie cannot be opened, the process ends through the platform's assertion report.
    void writeZULRtoFile(const FileLocation& file, const std::string& creatorName,
                         const std::string& creatorVersion) const;
};

/// Returns the record that `writeZULRtoFile` stores on this system.
ZULMETADATA_API ZCAPHeader recordingInfo(const std::string& creatorName, const std::string& creatorVersion);

} // namespace ZULMetaData
