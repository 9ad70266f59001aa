#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The presenter's comment on the slide that is shown.
class SlideInfoCommentMetaDataWriter final : public TextMetaDataWriter<SlideInfoCommentKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
