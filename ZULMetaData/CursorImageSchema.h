#pragma once

// The layout of a cursor image entry, as two lists of steps with one step for each field: the fields at the beginning
// of every entry, and the fields of the data part. A step says which versions of the stream have the field, when an
// entry has it, and where its bytes are in memory. A later version appends steps; older readers skip them.

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataCommon.h"

#include <cstdint>
#include <span>
#include <string_view>

namespace ZULMetaData {

/// An entry while it is written or read. The caller owns the image and the time.
struct Record {
    CursorImage& image;                 ///< the image that is written or filled
    double& timestamp;                  ///< seconds
    std::uint32_t entrySize = 0;        ///< the number of bytes after this field
    std::uint32_t justMetadataSize = 0; ///< the number of bytes in the data part
};

/// The place of a field's bytes. If `data` is null and `size` is not 0, there was not enough memory for the field.
struct FieldInfo {
    unsigned char* data; ///< points into the record or its image, and is valid as long as they are
    std::uint32_t size;  ///< in bytes
};

/// One field of an entry.
struct SchemaFieldStep {
    using Condition = bool (*)(const Record&);  ///< called when the fields before this one are known
    using FieldGetter = FieldInfo (*)(Record&); ///< called if the entry has the field

    std::string_view name;   ///< the name of the field; it is never stored
    std::int32_t minVersion; ///< the first version of streams with this field
    std::int32_t maxVersion; ///< the last version of streams with this field; 99 if there is no last one yet
    Condition condition;     ///< returns whether an entry has the field
    FieldGetter fieldGetter; ///< returns where the bytes of the field are

    /// Returns whether streams of this version have the field.
    constexpr bool existsIn(int version) const { return minVersion <= version && version <= maxVersion; }
};

/// The steps of one version. They are constants: a schema costs nothing to create, and its lists stay valid after it.
class ZULMETADATA_API CursorImageSchema {
public:
    using Steps = std::span<const SchemaFieldStep>; ///< steps in the order in which the fields are stored

    /// Accepts any version. A version below 1 or above 99 has no fields.
    explicit CursorImageSchema(int version) : version_(version) {}
    CursorImageSchema(const CursorImageSchema&) = default;            ///< copies the version
    CursorImageSchema& operator=(const CursorImageSchema&) = default; ///< copies the version
    virtual ~CursorImageSchema() = default;

    /// Returns the steps at the beginning of every entry: its size, its time, its identifier, and the size of the data
    /// part.
    virtual Steps GetBaseInfoSteps() const;
    virtual Steps GetDataSteps() const; ///< returns the steps of the data part: the image and the fields about it

    /// Computes both sizes of the record from its image.
    virtual void CalculateMetadataSizes(Record& record) const;

    /// Returns the sum of the sizes of all fields that the version and the record have. Calls their getters.
    std::uint32_t GetSizeOfSchemaFieldSteps(Steps steps, Record& record) const;

    /// Returns the size of the record's image. Entries of version 1 do not store it; there it is the rest of the data
    /// part.
    std::uint32_t GetImageSize(const Record& record) const;

    bool AlwaysFn(const Record& record) const; ///< returns true; the condition of fields that every entry has

    /// Returns whether the record has an image, or is about to get one while it is read.
    bool HasImageFn(const Record& record) const;

    /// Returns the getter of the image bytes. If the image has a size but no data, the getter allocates a buffer of
    /// zeros of that size, which then belongs to the image.
    SchemaFieldStep::FieldGetter GetImageFieldInfoFn() const;

private:
    int version_;
};

} // namespace ZULMetaData
