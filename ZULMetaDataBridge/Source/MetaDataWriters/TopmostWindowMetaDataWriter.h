#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes where the window on top is, in units of the display.
class TopmostWindowMetaDataWriter final : public ContinuousMetaDataWriter<TopmostWindowKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Stores the rectangle without fractions of pixels; see `truncated`.
    void write(const ScreenRect& window, const MediaTime& time) { append(truncated(window), time); }
};

} // namespace ZULMetaData
