#pragma once

// A track of a movie as far as its texts are concerned: what it is, and where its samples lie.

#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <vector>

namespace ZULMetaData::detail {

struct MovieTrack {
    ContainerItem atom; ///< its `trak`
    std::string path;
    std::uint64_t id = 0;
    std::string handler;                           ///< four characters, such as "text"
    std::map<std::uint32_t, ContainerItem> tables; ///< `stsz`, `stsc`, `stco` and so on, by their types

    /// Returns whether its samples are texts.
    bool holdsTexts() const;
};

struct SampleRange {
    std::uint64_t offset = 0; ///< in the file
    std::uint64_t size = 0;
};

/// Calls `visit` with every sample, in the order of the track, until it returns false. Samples of one size that are no
/// texts come as one range for each chunk. Returns false if its tables do not tell where they are;
/// some of the samples may have been visited then.
bool visitSamples(const MovieTrack& track, const ByteSource& file,
                  const std::function<bool(const SampleRange&)>& visit);

/// Returns the text of one sample.
std::vector<std::string> textsOfSample(std::string_view sample);

} // namespace ZULMetaData::detail
