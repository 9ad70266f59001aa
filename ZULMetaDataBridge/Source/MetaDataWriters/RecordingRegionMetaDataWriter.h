#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the region of the display that is recorded, in pixels.
class RecordingRegionMetaDataWriter final
    : public OneShotMetaDataWriter<RecordingRegionKind, StreamWriterRelease::WithWriter> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Writes the only entry, without fractions of pixels (see `truncated`), and closes the file. Later calls have no
    /// effect.
    void writeAndFinalize(const ScreenRect& region) {
        writeOnce([&] { return truncated(region); });
    }
};

} // namespace ZULMetaData
