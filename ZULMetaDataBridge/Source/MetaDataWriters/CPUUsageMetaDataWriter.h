#pragma once

#include "KindMetaDataWriter.h"

namespace ZULMetaData {

/// Writes how busy the machine was, in a unit that the recorder chooses.
class CPUUsageMetaDataWriter final : public ContinuousMetaDataWriter<CPUUsageKind> {
public:
    using ContinuousMetaDataWriter::ContinuousMetaDataWriter;

    void write(float usage, const MediaTime& time) { append(usage, time); } ///< stores `usage` unchanged
};

} // namespace ZULMetaData
