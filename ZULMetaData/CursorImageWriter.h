#pragma once

// Writes and reads a cursor image entry, step by step along its schema. The layout of version 2, with n bytes of image:
//
//     0   entrySize = 40 + n        20  justMetadataSize = 20 + n   32      hotspotY
//     4   timestamp                 24  imageSizeV2 = n             36      imageData
//     12  cursorID                  28  hotspotX                    36 + n  cursorType, 40 + n cursorFlags

#include "../SharedDependencies/Export.h"
#include "CursorImageSchema.h"

#include <cstdint>
#include <iosfwd>

namespace ZULMetaData {

/// Writes one entry. It never checks the state of the stream.
class ZULMETADATA_API CursorImageWriter {
public:
    explicit CursorImageWriter(int version) : version_(version) {} ///< takes the version of the stream

    void Write(std::ostream& stream, const FieldInfo& field); ///< writes zeros if the field has no data

    /// Computes the sizes of the record, then writes both parts of the entry.
    void WriteCursorImageMetaData(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    /// Writes the first part only, with the sizes that the record has.
    void WriteBaseInfo(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    /// Writes the data part only.
    void WriteMetaDataFields(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    std::uint32_t bytesWritten() const {
        return bytesWritten_;
    } ///< returns the number of bytes that all calls have written

private:
    void writeSteps(std::ostream& stream, CursorImageSchema::Steps steps, Record& record);

    std::uint32_t bytesWritten_ = 0;
    std::int32_t version_;
};

/// Reads one entry.
class ZULMETADATA_API CursorImageReader {
public:
    explicit CursorImageReader(int version) : version_(version) {} ///< takes the version in the stream's header

    void Read(std::istream& stream, const FieldInfo& field); ///< bytes that the input lacks are not changed

    /// Reads both parts of an entry.
    void ReadCursorImageMetaData(std::istream& stream, const CursorImageSchema& schema, Record& record);

    /// Reads the first part. Throws `InvalidEntry` if the input ends before one of the fields.
    void ReadBaseInfo(std::istream& stream, const CursorImageSchema& schema, Record& record);

    /// Reads the data part and replaces the image. Stops without an error at the first field that does not fit into the
    /// data part or is beyond the end of the input, and skips the rest of the data part. If the image does not fit, or
    /// if there is no memory for it, the record has neither data nor size afterwards. If the input ends inside the
    /// image, the missing bytes are zeros.
    void ReadMetaDataFields(std::istream& stream, const CursorImageSchema& schema, Record& record);

    void IgnoreLeftoverBytes(std::istream& stream,
                             std::uint32_t count); ///< skips `count` bytes, or all bytes until the end of the input

    /// Returns the number of bytes of the data part that have not been read.
    std::uint32_t bytesLeft() const { return bytesLeft_; }

    /// Returns whether an image was left out because there was no memory for it.
    bool hasRunOutOfMemory() const { return hasRunOutOfMemory_; }

private:
    bool readImage(std::istream& stream, const CursorImageSchema& schema, Record& record);
    bool readField(std::istream& stream, const FieldInfo& field);

    std::int32_t version_;
    std::uint32_t bytesLeft_ = 0;
    bool hasRunOutOfMemory_ = false;
};

/// Writes an entry with a schema and a record of the caller.
template <class Schema, class R>
void metaDataWriteWithSchema(Schema& schema, R& record, std::ostream& stream, int version) {
    CursorImageWriter(version).WriteCursorImageMetaData(stream, schema, record);
}

namespace detail {

ZULMETADATA_API void writeCursorImageEntry(double time, const CursorImage& image, std::ostream& stream, int version);

/// Returns the number of bytes that the entry took. The number means nothing if the input ended inside the entry.
ZULMETADATA_API std::uint64_t readCursorImageEntry(std::istream& stream, double& time, CursorImage& image, int version);

} // namespace detail

} // namespace ZULMetaData
