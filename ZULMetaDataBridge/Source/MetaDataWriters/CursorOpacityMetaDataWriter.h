#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes how opaque the cursor is drawn, from 0 to 1.
class CursorOpacityMetaDataWriter final : public ContinuousMetaDataWriter<CursorOpacityKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Stores `opacity` unchanged, even if it is not between 0 and 1.
    void write(double opacity, const MediaTime& time) { append(opacity, time); }
};

} // namespace ZULMetaData
