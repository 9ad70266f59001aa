#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The title of the window on top.
class TopmostWindowTitleMetaDataWriter final : public TextMetaDataWriter<TopmostWindowTitleKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
