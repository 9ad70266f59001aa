#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes the buttons that are pressed and released, and the modifiers, as the bits that `HumanReadableActions` names.
class CursorActionMetaDataWriter final : public ContinuousMetaDataWriter<CursorActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    void write(std::int32_t action, const MediaTime& time) { append(action, time); } ///< stores the bits unchanged
};

} // namespace ZULMetaData
