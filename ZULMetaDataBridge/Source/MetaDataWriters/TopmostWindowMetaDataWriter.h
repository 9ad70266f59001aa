#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Where the window on top was, in pixels.
class TopmostWindowMetaDataWriter final : public ContinuousMetaDataWriter<TopmostWindowKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Fractions are cut off: see `truncated`.
    void write(const ScreenRect& window, const MediaTime& time) { append(truncated(window), time); }
};

} // namespace ZULMetaData
