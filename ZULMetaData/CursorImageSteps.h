#pragma once

// The steps of a cursor image entry. Constants, so that a walk over them can be unrolled.

#include "ZULMetaData/CursorImageSchema.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <utility>

namespace ZULMetaData::detail {

inline constexpr std::int32_t s_lastVersion = 99;
inline constexpr std::uint32_t s_hotspotSize = 8;

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

inline FieldInfo timestampField(Record& record) {
    return fieldOf(record.timestamp);
}

inline bool always(const Record&) {
    return true;
}

inline bool hasImage(const Record& record) {
    return record.image.imageData || record.image.imageDataSize != 0;
}

/// Version 1 stores no image size: a data part that is not empty always carries an image.
inline bool hasImageV1(const Record& record) {
    return hasImage(record) || record.justMetadataSize != 0;
}

inline FieldInfo imageBytes(Record& record) {
    CursorImage& image = record.image;
    if (!image.imageData && image.imageDataSize != 0)
        image.imageData = static_cast<unsigned char*>(std::calloc(image.imageDataSize, 1));
    return {image.imageData, image.imageDataSize};
}

/// Wraps around if the data part is too small for a hot spot; such an image never fits.
inline std::uint32_t imageSizeV1(const Record& record) {
    return record.justMetadataSize - s_hotspotSize;
}

inline FieldInfo imageBytesV1(Record& record) {
    if (!record.image.imageData)
        record.image.imageDataSize = imageSizeV1(record);
    return imageBytes(record);
}

inline constexpr std::array<SchemaFieldStep, 4> s_baseInfoSteps{{
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

inline constexpr auto s_dataStepsV1 = dataSteps(hasImageV1, imageBytesV1);
inline constexpr auto s_dataSteps = dataSteps(hasImage, imageBytes);

/// Hands the fields that exist and are present to `visit`. Every condition and getter is inlined, a few instructions
/// instead of two calls.
template <const auto& steps, class Visit>
void forEachField(Record& record, int version, Visit visit) {
    const auto visitStep = [&]<std::size_t i>() {
        if (steps[i].existsIn(version) && steps[i].condition(record))
            visit(steps[i].fieldGetter(record));
    };
    const auto visitAll = [&]<std::size_t... i>(std::index_sequence<i...>) {
        (visitStep.template operator()<i>(), ...);
    };
    visitAll(std::make_index_sequence<steps.size()>());
}

} // namespace ZULMetaData::detail
