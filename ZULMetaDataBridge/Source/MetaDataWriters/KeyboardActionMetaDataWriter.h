#pragma once

#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Keys pressed, as virtual-key codes with the modifier flags that `HumanReadableActions` names.
class KeyboardActionMetaDataWriter final : public ContinuousMetaDataWriter<KeyboardActionKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    /// `eventFlag` has a bit for each modifier that is held down. Both are stored as they are.
    void writeCharacterCode(std::uint32_t characterCode, std::uint32_t eventFlag, const MediaTime& time) {
        append(KeyStroke(characterCode, eventFlag), time);
    }
};

} // namespace ZULMetaData
