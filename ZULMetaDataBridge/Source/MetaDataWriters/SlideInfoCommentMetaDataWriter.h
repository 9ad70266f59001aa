#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the presenter's comments on the slides that are shown.
class SlideInfoCommentMetaDataWriter final : public TextMetaDataWriter<SlideInfoCommentKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
