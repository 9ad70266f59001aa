#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes the keys that are pressed, as virtual-key codes and the modifier flags that `HumanReadableActions` names.
class KeyboardActionMetaDataWriter final : public ContinuousMetaDataWriter<KeyboardActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// Stores both numbers unchanged. `eventFlag` has one bit for each modifier that is held down.
    void writeCharacterCode(std::uint32_t characterCode, std::uint32_t eventFlag, const MediaTime& time) {
        append(KeyStroke(characterCode, eventFlag), time);
    }
};

} // namespace ZULMetaData
