#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the texts of the slides that are shown.
class SlideInfoTextMetaDataWriter final : public TextMetaDataWriter<SlideInfoTextKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
