#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the titles of the window on top.
class TopmostWindowTitleMetaDataWriter final : public TextMetaDataWriter<TopmostWindowTitleKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
