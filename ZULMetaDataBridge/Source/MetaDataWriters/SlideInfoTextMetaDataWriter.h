#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The text of the slide that is shown.
class SlideInfoTextMetaDataWriter final : public TextMetaDataWriter<SlideInfoTextKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
