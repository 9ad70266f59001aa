#include "ZULMetaData/CursorImageWriter.h"

#include "ZULMetaData/CursorImageSteps.h"
#include "ZULMetaData/InvalidEntry.h"
#include "ZULMetaData/StreamBufferAccess.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <istream>
#include <limits>
#include <ostream>

namespace ZULMetaData {

void CursorImageWriter::Write(std::ostream& stream, const FieldInfo& field) {
    if (field.data)
        detail::writeBytes(stream, reinterpret_cast<const char*>(field.data), field.size);
    else // memory for an image without bytes ran out: it would have been zeros
        for (std::uint32_t written = 0; written < field.size; ++written)
            stream.put('\0');
    bytesWritten_ += field.size;
}

void CursorImageWriter::WriteCursorImageMetaData(std::ostream& stream, const CursorImageSchema& schema,
                                                 Record& record) {
    bytesWritten_ = 0;
    schema.CalculateMetadataSizes(record);
    WriteBaseInfo(stream, schema, record);
    WriteMetaDataFields(stream, schema, record);
}

void CursorImageWriter::WriteBaseInfo(std::ostream& stream, const CursorImageSchema& schema, Record& record) {
    writeSteps(stream, schema.GetBaseInfoSteps(), record);
}

void CursorImageWriter::WriteMetaDataFields(std::ostream& stream, const CursorImageSchema& schema, Record& record) {
    writeSteps(stream, schema.GetDataSteps(), record);
}

void CursorImageWriter::writeSteps(std::ostream& stream, CursorImageSchema::Steps steps, Record& record) {
    for (const SchemaFieldStep& step : steps)
        if (step.existsIn(version_) && step.condition(record))
            Write(stream, step.fieldGetter(record));
}

void CursorImageReader::Read(std::istream& stream, const FieldInfo& field) {
    if (field.size != 0)
        detail::readBytes(stream, reinterpret_cast<char*>(field.data), field.size);
    if (bytesLeft_ >= field.size)
        bytesLeft_ -= field.size;
}

void CursorImageReader::ReadCursorImageMetaData(std::istream& stream, const CursorImageSchema& schema, Record& record) {
    ReadBaseInfo(stream, schema, record);
    ReadMetaDataFields(stream, schema, record);
}

void CursorImageReader::ReadBaseInfo(std::istream& stream, const CursorImageSchema& schema, Record& record) {
    for (const SchemaFieldStep& step : schema.GetBaseInfoSteps()) {
        detail::throwIfInputEnded(stream);
        if (step.existsIn(version_) && step.condition(record))
            Read(stream, step.fieldGetter(record));
    }
}

void CursorImageReader::ReadMetaDataFields(std::istream& stream, const CursorImageSchema& schema, Record& record) {
    bytesLeft_ = record.justMetadataSize;
    record.image.freeImageData(true);
    for (const SchemaFieldStep& step : schema.GetDataSteps()) {
        if (bytesLeft_ == 0)
            break;
        if (!step.existsIn(version_) || !step.condition(record))
            continue;
        const bool isImage = step.fieldGetter == schema.GetImageFieldInfoFn();
        if (isImage ? !readImage(stream, schema, record) : !readField(stream, step.fieldGetter(record)))
            break;
    }
    if (!detail::inputEnded(stream))
        IgnoreLeftoverBytes(stream, bytesLeft_);
}

/// Asks for no memory before the image is known to fit.
bool CursorImageReader::readImage(std::istream& stream, const CursorImageSchema& schema, Record& record) {
    const bool fits = schema.GetImageSize(record) <= bytesLeft_ && !detail::inputEnded(stream);
    if (fits && readField(stream, schema.GetImageFieldInfoFn()(record)))
        return true;
    record.image.freeImageData(true);
    return false;
}

bool CursorImageReader::readField(std::istream& stream, const FieldInfo& field) {
    const bool outOfMemory = !field.data && field.size != 0;
    hasRunOutOfMemory_ = hasRunOutOfMemory_ || outOfMemory;
    if (detail::inputEnded(stream) || bytesLeft_ < field.size || outOfMemory)
        return false;
    Read(stream, field);
    return true;
}

void CursorImageReader::IgnoreLeftoverBytes(std::istream& stream, std::uint32_t count) {
    constexpr std::uint32_t most = std::numeric_limits<std::int32_t>::max(); // that every `std::streamsize` holds
    for (; count != 0 && stream.good(); count -= std::min(count, most))
        stream.ignore(static_cast<std::streamsize>(std::min(count, most)));
}

namespace detail {

namespace {

/// Lets a constant image pass through the schema, which takes and may complete mutable ones, without copying
/// its bytes. They stay the original's; a buffer that the schema added is freed.
class ImageView {
public:
    explicit ImageView(const CursorImage& original)
        : borrowed_(original.imageData),
          image_(original.uniqueId, original.hotspotOffsetX, original.hotspotOffsetY, original.imageData,
                 original.imageDataSize, original.cursorTypeId, original.flags) {}
    ImageView(const ImageView&) = delete;
    ImageView& operator=(const ImageView&) = delete;
    ~ImageView() { image_.freeImageData(image_.imageData != borrowed_); }

    CursorImage& image() { return image_; }

private:
    const unsigned char* borrowed_;
    CursorImage image_;
};

/// What walking the schema writes, for entries that the put area has room for: a cursor that was seen before takes a
/// quarter of the time. Returns false if it has not; nothing is written then.
bool packEntry(Record& record, std::ostream& stream, int version) {
    std::uint64_t baseSize = 0;
    std::uint64_t dataSize = 0; // may be more than its 32 bits on disk
    forEachField<s_baseInfoSteps>(record, version, [&](const FieldInfo& field) { baseSize += field.size; });
    forEachField<s_dataSteps>(record, version, [&](const FieldInfo& field) { dataSize += field.size; });
    const auto size = static_cast<std::size_t>(baseSize + dataSize); // too little only where there is no image
    char* place = placeFor(stream, size);
    const bool outOfMemory = record.image.imageDataSize != 0 && !record.image.imageData;
    if (!place || outOfMemory)
        return false;
    record.justMetadataSize = static_cast<std::uint32_t>(dataSize);
    record.entrySize = static_cast<std::uint32_t>(baseSize + dataSize - sizeof record.entrySize);
    const auto pack = [&](const FieldInfo& field) {
        std::memcpy(place, field.data, field.size);
        place += field.size;
    };
    forEachField<s_baseInfoSteps>(record, version, pack);
    forEachField<s_dataSteps>(record, version, pack);
    StreamBufferAccess::advancePut(*stream.rdbuf(), size);
    return true;
}

} // namespace

void writeCursorImageEntry(double time, const CursorImage& image, std::ostream& stream, int version) {
    ImageView view(image);
    Record record{view.image(), time};
    if (version != 1 && packEntry(record, stream, version))
        return;
    const CursorImageSchema schema(version);
    metaDataWriteWithSchema(schema, record, stream, version);
}

std::uint64_t readCursorImageEntry(std::istream& stream, double& time, CursorImage& image, int version) {
    const CursorImageSchema schema(version);
    Record record{image, time};
    CursorImageReader(version).ReadCursorImageMetaData(stream, schema, record);
    const std::uint64_t baseInfoSize = schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record);
    return baseInfoSize + record.justMetadataSize;
}

} // namespace detail

} // namespace ZULMetaData
