#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the titles of the slides that are shown.
class SlideInfoTitleMetaDataWriter final : public TextMetaDataWriter<SlideInfoTitleKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
