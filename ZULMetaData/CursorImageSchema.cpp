#include "ZULMetaData/CursorImageSchema.h"

#include <array>
#include <cstdlib>

namespace ZULMetaData {

namespace {

constexpr std::int32_t s_lastVersion = 99;
constexpr std::uint32_t s_hotspotSize = 8;

template <class T>
FieldInfo fieldOf(T& member) {
    return {reinterpret_cast<unsigned char*>(&member), sizeof member};
}

template <auto Member>
FieldInfo recordField(Record& record) {
    return fieldOf(record.*Member);
}

template <auto Member>
FieldInfo imageField(Record& record) {
    return fieldOf(record.image.*Member);
}

FieldInfo timestampField(Record& record) {
    return fieldOf(record.timestamp);
}

bool always(const Record&) {
    return true;
}

bool hasImage(const Record& record) {
    return record.image.imageData || record.image.imageDataSize != 0;
}

/// Version 1 stores no image size: a data part that is not empty always carries an image.
bool hasImageV1(const Record& record) {
    return hasImage(record) || record.justMetadataSize != 0;
}

FieldInfo imageBytes(Record& record) {
    CursorImage& image = record.image;
    if (!image.imageData && image.imageDataSize != 0)
        image.imageData = static_cast<unsigned char*>(std::calloc(image.imageDataSize, 1));
    return {image.imageData, image.imageDataSize};
}

/// Wraps around where the data part is too small for a hot spot; such an image never fits.
std::uint32_t imageSizeV1(const Record& record) {
    return record.justMetadataSize - s_hotspotSize;
}

FieldInfo imageBytesV1(Record& record) {
    if (!record.image.imageData)
        record.image.imageDataSize = imageSizeV1(record);
    return imageBytes(record);
}

constexpr std::array<SchemaFieldStep, 4> s_baseInfoSteps{{
    {"entrySize", 1, s_lastVersion, always, recordField<&Record::entrySize>},
    {"timestamp", 1, s_lastVersion, always, timestampField},
    {"cursorID", 1, s_lastVersion, always, imageField<&CursorImage::uniqueId>},
    {"justMetadataSize", 1, s_lastVersion, always, recordField<&Record::justMetadataSize>},
}};

using Condition = SchemaFieldStep::Condition;
using FieldGetter = SchemaFieldStep::FieldGetter;

/// The order is the format: the cursor's type follows the image that it depends on, the flags come last.
constexpr std::array<SchemaFieldStep, 6> dataSteps(Condition imagePresent, FieldGetter imageGetter) {
    return {{
        {"imageSizeV2", 2, s_lastVersion, always, imageField<&CursorImage::imageDataSize>},
        {"hotspotX", 1, s_lastVersion, imagePresent, imageField<&CursorImage::hotspotOffsetX>},
        {"hotspotY", 1, s_lastVersion, imagePresent, imageField<&CursorImage::hotspotOffsetY>},
        {"imageData", 1, s_lastVersion, imagePresent, imageGetter},
        {"cursorType", 2, s_lastVersion, imagePresent, imageField<&CursorImage::cursorTypeId>},
        {"cursorFlags", 2, s_lastVersion, always, imageField<&CursorImage::flags>},
    }};
}

constexpr auto s_dataStepsV1 = dataSteps(hasImageV1, imageBytesV1);
constexpr auto s_dataSteps = dataSteps(hasImage, imageBytes);

} // namespace

CursorImageSchema::Steps CursorImageSchema::GetBaseInfoSteps() const {
    return s_baseInfoSteps;
}

CursorImageSchema::Steps CursorImageSchema::GetDataSteps() const {
    return version_ == 1 ? s_dataStepsV1 : s_dataSteps;
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
    return derived ? imageSizeV1(record) : record.image.imageDataSize;
}

bool CursorImageSchema::AlwaysFn(const Record& record) const {
    return always(record);
}

bool CursorImageSchema::HasImageFn(const Record& record) const {
    return version_ == 1 ? hasImageV1(record) : hasImage(record);
}

SchemaFieldStep::FieldGetter CursorImageSchema::GetImageFieldInfoFn() const {
    return version_ == 1 ? imageBytesV1 : imageBytes;
}

} // namespace ZULMetaData
