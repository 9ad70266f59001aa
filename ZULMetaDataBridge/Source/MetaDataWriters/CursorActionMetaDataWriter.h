#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Buttons pressed and released, with modifiers, as the bits that `HumanReadableActions` names.
class CursorActionMetaDataWriter final : public ContinuousMetaDataWriter<CursorActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    void write(std::int32_t action, const MediaTime& time) { append(action, time); } ///< bits, stored as they are
};

} // namespace ZULMetaData
