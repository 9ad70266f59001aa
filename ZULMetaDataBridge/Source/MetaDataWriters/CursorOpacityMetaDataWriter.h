#pragma once

#include "ZULMetaDataBridge/Source/MetaDataWriters/KindMetaDataWriter.h"

namespace ZULMetaData {

/// How opaque the cursor was drawn, 0 to 1.
class CursorOpacityMetaDataWriter final : public ContinuousMetaDataWriter<CursorOpacityKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    void write(double opacity, const MediaTime& time) { append(opacity, time); }
};

} // namespace ZULMetaData
