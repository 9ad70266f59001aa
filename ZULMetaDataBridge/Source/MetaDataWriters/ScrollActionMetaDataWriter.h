#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// How far was scrolled, in pixels.
class ScrollActionMetaDataWriter final : public ContinuousMetaDataWriter<ScrollActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Fractions are cut off: see `truncated`.
    void write(const ScreenPoint& delta, const MediaTime& time) { append(truncated(delta), time); }
};

} // namespace ZULMetaData
