#include "ZULMetaData/CursorImageSchema.h"

#include "ZULMetaData/CursorImageSteps.h"

namespace ZULMetaData {

CursorImageSchema::Steps CursorImageSchema::GetBaseInfoSteps() const {
    return detail::s_baseInfoSteps;
}

CursorImageSchema::Steps CursorImageSchema::GetDataSteps() const {
    return version_ == 1 ? detail::s_dataStepsV1 : detail::s_dataSteps;
}

void CursorImageSchema::CalculateMetadataSizes(Record& record) const {
    record.justMetadataSize = GetSizeOfSchemaFieldSteps(GetDataSteps(), record);
    const std::uint32_t baseInfoSize = GetSizeOfSchemaFieldSteps(GetBaseInfoSteps(), record);
    record.entrySize = record.justMetadataSize + baseInfoSize - static_cast<std::uint32_t>(sizeof record.entrySize);
}

std::uint32_t CursorImageSchema::GetSizeOfSchemaFieldSteps(Steps steps, Record& record) const {
    std::uint32_t size = 0;
    for (const SchemaFieldStep& step : steps)
        if (step.existsIn(version_) && step.condition(record))
            size += step.fieldGetter(record).size;
    return size;
}

std::uint32_t CursorImageSchema::GetImageSize(const Record& record) const {
    const bool derived = !record.image.imageData && version_ == 1;
    return derived ? detail::imageSizeV1(record) : record.image.imageDataSize;
}

bool CursorImageSchema::AlwaysFn(const Record& record) const {
    return detail::always(record);
}

bool CursorImageSchema::HasImageFn(const Record& record) const {
    return version_ == 1 ? detail::hasImageV1(record) : detail::hasImage(record);
}

SchemaFieldStep::FieldGetter CursorImageSchema::GetImageFieldInfoFn() const {
    return version_ == 1 ? detail::imageBytesV1 : detail::imageBytes;
}

} // namespace ZULMetaData
