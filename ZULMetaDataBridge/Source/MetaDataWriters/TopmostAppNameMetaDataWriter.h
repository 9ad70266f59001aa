#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes the names of the applications that come to the front.
class TopmostAppNameMetaDataWriter final : public TextMetaDataWriter<TopmostAppNameKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
