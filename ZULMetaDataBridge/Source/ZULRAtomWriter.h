#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"
#include "../../SharedDependencies/ZCAPHeader.h"

#include <string>

namespace ZULMetaData {

/// Stamps a movie as recorders always have; `SafeMovieSave::stamp` is the safe way.
class ZULMETADATA_API ZULRAtomWriter {
public:
    /// Repairs the movie's last atom and appends a `ZULR` atom of 80 bytes: the header, then a `ZCAPHeader` of
    /// version 1. Every call appends another one.
    ///
    /// The stored creator's name is always the platform's, in place of `creatorName`: readers tell platforms apart
    /// by it. A movie that cannot be opened ends the process through the platform's assertion report.
    void writeZULRtoFile(const FileLocation& file, const std::string& creatorName,
                         const std::string& creatorVersion) const;
};

/// What `writeZULRtoFile` stores, for the system that this program runs on.
ZULMETADATA_API ZCAPHeader recordingInfo(const std::string& creatorName, const std::string& creatorVersion);

} // namespace ZULMetaData
