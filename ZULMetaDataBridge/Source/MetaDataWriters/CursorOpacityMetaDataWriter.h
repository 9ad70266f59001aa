#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// How opaque the cursor was drawn, 0 to 1.
class CursorOpacityMetaDataWriter final : public ContinuousMetaDataWriter<CursorOpacityKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Stored as it is, also outside of 0 to 1.
    void write(double opacity, const MediaTime& time) { append(opacity, time); }
};

} // namespace ZULMetaData
