#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes scroll deltas, in pixels.
class ScrollActionMetaDataWriter final : public ContinuousMetaDataWriter<ScrollActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Stores the delta without fractions of pixels; see `truncated`.
    void write(const ScreenPoint& delta, const MediaTime& time) { append(truncated(delta), time); }
};

} // namespace ZULMetaData
