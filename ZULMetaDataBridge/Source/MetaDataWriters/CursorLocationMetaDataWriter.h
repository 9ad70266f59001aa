#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes where the cursor is, in units of the display, many times a second.
class CursorLocationMetaDataWriter final : public CountedMetaDataWriter<CursorLocationKind> {
public:
    using CountedMetaDataWriter::CountedMetaDataWriter;

    /// Stores the position without fractions of pixels; see `truncated`.
    void write(const ScreenPoint& location, const MediaTime& time) { append(truncated(location), time); }

    /// Returns the number of entries since the last flush, including the entry that was flushed.
    std::uint32_t locationsWritten() const { return written(); }
    void setLocationsWritten(std::uint32_t count) { setWritten(count); } ///< 0 makes the next entry flush
};

} // namespace ZULMetaData
