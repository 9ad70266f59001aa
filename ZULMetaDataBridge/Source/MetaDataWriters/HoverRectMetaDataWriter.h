#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes the rectangle that the cursor hovers over, in pixels, many times a second.
class HoverRectMetaDataWriter final : public CountedMetaDataWriter<HoverRectKind> {
public:
    using CountedMetaDataWriter::CountedMetaDataWriter;

    /// Stores the rectangle without fractions of pixels; see `truncated`.
    void write(const ScreenRect& rect, const MediaTime& time) { append(truncated(rect), time); }

    /// Returns the number of entries since the last flush, including the entry that was flushed.
    std::uint32_t rectsWritten() const { return written(); }
    void setRectsWritten(std::uint32_t count) { setWritten(count); } ///< 0 makes the next entry flush
};

} // namespace ZULMetaData
