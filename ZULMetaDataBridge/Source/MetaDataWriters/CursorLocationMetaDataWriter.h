#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Where the cursor was, in pixels of the recorded display. Comes many times a second.
class CursorLocationMetaDataWriter final : public CountedMetaDataWriter<CursorLocationKind> {
public:
    using CountedMetaDataWriter::CountedMetaDataWriter;

    /// Fractions are cut off: see `truncated`.
    void write(const ScreenPoint& location, const MediaTime& time) { append(truncated(location), time); }

    /// Since the last flush, the flushed one included.
    std::uint32_t locationsWritten() const { return written(); }
    void setLocationsWritten(std::uint32_t count) { setWritten(count); } ///< 0 makes the next entry a flushed one
};

} // namespace ZULMetaData
