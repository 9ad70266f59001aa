#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// The scale factor of the recorded display. Its stream writer stays when it goes.
class ScaleFactorMetaDataWriter final : public OneShotMetaDataWriter<ScaleFactorKind, StreamWriterRelease::Never> {
public:
    using OneShotMetaDataWriter::OneShotMetaDataWriter;

    /// Only the first call counts.
    void writeAndFinalize(std::int32_t scaleFactor) {
        writeOnce([&] { return scaleFactor; });
    }
};

} // namespace ZULMetaData
