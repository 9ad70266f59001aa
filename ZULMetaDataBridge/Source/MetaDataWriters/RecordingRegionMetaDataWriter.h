#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The region of the display that is recorded, in pixels.
class RecordingRegionMetaDataWriter final
    : public OneShotMetaDataWriter<RecordingRegionKind, StreamWriterRelease::WithWriter> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Only the first call counts. Fractions are cut off: see `truncated`.
    void writeAndFinalize(const ScreenRect& region) {
        writeOnce([&] { return truncated(region); });
    }
};

} // namespace ZULMetaData
