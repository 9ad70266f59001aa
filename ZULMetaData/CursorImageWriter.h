#pragma once

// Writes and reads one cursor image entry by walking the steps of its schema. Version 2, with n bytes of image:
//
//     0   entrySize = 40 + n        20  justMetadataSize = 20 + n   32      hotspotY
//     4   timestamp                 24  imageSizeV2 = n             36      imageData
//     12  cursorID                  28  hotspotX                    36 + n  cursorType, 40 + n cursorFlags

#include "../SharedDependencies/Export.h"
#include "CursorImageSchema.h"

#include <cstdint>
#include <iosfwd>

namespace ZULMetaData {

/// Made for one entry. Never looks at the state of the stream.
class ZULMETADATA_API CursorImageWriter {
public:
    explicit CursorImageWriter(int version) : version_(version) {} ///< that of the stream

    void Write(std::ostream& stream, const FieldInfo& field); ///< zeros where the field has no data

    /// Computes the sizes of the record, then writes both parts of the entry.
    void WriteCursorImageMetaData(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    /// The first part alone, with the sizes that the record has.
    void WriteBaseInfo(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    /// The data part alone.
    void WriteMetaDataFields(std::ostream& stream, const CursorImageSchema& schema, Record& record);

    std::uint32_t bytesWritten() const { return bytesWritten_; } ///< of the entry, by all calls so far

private:
    void writeSteps(std::ostream& stream, CursorImageSchema::Steps steps, Record& record);

    std::uint32_t bytesWritten_ = 0;
    std::int32_t version_;
};

/// Made for one entry.
class ZULMETADATA_API CursorImageReader {
public:
    explicit CursorImageReader(int version) : version_(version) {} ///< as the stream's header says

    void Read(std::istream& stream, const FieldInfo& field); ///< what the input lacks stays as it was

    /// Both parts of an entry.
    void ReadCursorImageMetaData(std::istream& stream, const CursorImageSchema& schema, Record& record);

    /// Throws `std::runtime_error` "invalid meta data entry" where the input ends in front of one of the fields.
    void ReadBaseInfo(std::istream& stream, const CursorImageSchema& schema, Record& record);

    /// Replaces the image. Stops quietly at the first field that does not fit into the data part or lies behind
    /// the end of the input, and skips what is left of the data part. An image that does not fit leaves neither
    /// data nor size; one cut short by the end of the input is filled up with zeros.
    void ReadMetaDataFields(std::istream& stream, const CursorImageSchema& schema, Record& record);

    void IgnoreLeftoverBytes(std::istream& stream, std::uint32_t count); ///< fewer where the input ends

    /// Of the data part.
    std::uint32_t bytesLeft() const { return bytesLeft_; }

private:
    bool readImage(std::istream& stream, const CursorImageSchema& schema, Record& record);
    bool readField(std::istream& stream, const FieldInfo& field);

    std::int32_t version_;
    std::uint32_t bytesLeft_ = 0;
};

/// Writes an entry whose schema and record the caller holds.
template <class Schema, class R>
void metaDataWriteWithSchema(Schema& schema, R& record, std::ostream& stream, int version) {
    CursorImageWriter(version).WriteCursorImageMetaData(stream, schema, record);
}

namespace detail {

ZULMETADATA_API void writeCursorImageEntry(double time, const CursorImage& image, std::ostream& stream, int version);

/// Gives the bytes that the entry took; meaningless where the input ended inside it.
ZULMETADATA_API std::uint64_t readCursorImageEntry(std::istream& stream, double& time, CursorImage& image, int version);

} // namespace detail

} // namespace ZULMetaData
