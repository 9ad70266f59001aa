#pragma once

#include "../../SharedDependencies/Export.h"
#include "../ZULMMetaDataUUIDs.h"

#include <map>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Appends streams to a movie as one `ZULM` atom of `DATA` atoms. An incomplete entry at the end of a stream is left
/// out, but the size of the `DATA` atom includes it. If entries vary in size and one has a size of 0, both functions
/// throw `std::runtime_error` "Got an entry size of 0". The atom then keeps a size of 0, which `finalizeAtomsInFile`
/// repairs.
struct ZULMETADATA_API MP4MetaData {
    /// Appends stream files. If the movie or a stream file cannot be opened, prints a line on standard output and
    /// returns false. The other streams are appended anyway.
    static bool appendMetaDataFiles(const std::string& path, const std::vector<std::string>& files);

    /// Appends streams from memory, in ascending order of their kinds. Failures are not reported.
    static void appendMetaData(const std::string& path, const std::map<uuid, std::string>& streams);
};

} // namespace ZULMetaData
