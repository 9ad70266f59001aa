#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// The name of the application in front.
class TopmostAppNameMetaDataWriter final : public TextMetaDataWriter<TopmostAppNameKind> {
public:
    using TextMetaDataWriter::TextMetaDataWriter;
};

} // namespace ZULMetaData
