#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes the scale factor of the recorded display. Its stream writer is never released.
class ScaleFactorMetaDataWriter final : public OneShotMetaDataWriter<ScaleFactorKind, StreamWriterRelease::Never> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Writes the only entry and closes the file. Later calls have no effect.
    void writeAndFinalize(std::int32_t scaleFactor) {
        writeOnce([&] { return scaleFactor; });
    }
};

} // namespace ZULMetaData
