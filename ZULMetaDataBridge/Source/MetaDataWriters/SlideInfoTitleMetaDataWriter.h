#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The title of the slide that is shown.
class SlideInfoTitleMetaDataWriter final : public TextMetaDataWriter<SlideInfoTitleKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
