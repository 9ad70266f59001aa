#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// The rectangle that the cursor hovers over, in pixels. Comes many times a second.
class HoverRectMetaDataWriter final : public CountedMetaDataWriter<HoverRectKind> {
public:
    using CountedMetaDataWriter::CountedMetaDataWriter;

    /// Fractions are cut off: see `truncated`.
    void write(const ScreenRect& rect, const MediaTime& time) { append(truncated(rect), time); }

    /// Since the last flush, the flushed one included.
    std::uint32_t rectsWritten() const { return written(); }
    void setRectsWritten(std::uint32_t count) { setWritten(count); } ///< 0 makes the next entry a flushed one
};

} // namespace ZULMetaData
