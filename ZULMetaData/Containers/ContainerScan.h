#pragma once

// Finds the metadata streams of a container by walking its headers; the media in between is never read.

#include "ZULMetaData/ZULMMetaDataParser.h"

#include <istream>
#include <map>

namespace ZULMetaData::detail {

using StreamCache = std::map<uuid, MetaDataParser::CachedFileData>;

/// `stream` stands at its start and holds `total` bytes; the first chunk is at `begin`. A malformed container ends the
/// scan with what was found so far. Of two streams of one kind the later one counts.
void scanAtoms(std::istream& stream, std::uint64_t total, StreamCache& found, ScanMessages messages);
void scanChunks(std::istream& stream, std::uint64_t total, StreamCache& found, ScanMessages messages,
                std::uint64_t begin = 0);

/// The whole file is one stream, however short it is.
void scanRawStream(std::istream& stream, std::uint64_t total, StreamCache& found);

} // namespace ZULMetaData::detail
