#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// How busy the machine was, in the unit that the recorder measures.
class CPUUsageMetaDataWriter final : public ContinuousMetaDataWriter<CPUUsageKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    void write(float usage, const MediaTime& time) { append(usage, time); } ///< stored as it is
};

} // namespace ZULMetaData
