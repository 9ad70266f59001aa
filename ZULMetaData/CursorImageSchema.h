#pragma once

// The layout of a cursor image entry, as two lists of field steps: what every entry begins with, and the data
// part. A step says for which stream versions its field exists, when it is present, and where its bytes lie in
// memory. A later version appends steps; older readers skip what they do not know.

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataCommon.h"

#include <cstdint>
#include <span>
#include <string_view>

namespace ZULMetaData {

/// One entry while it is written or read. Image and time belong to the caller.
struct Record {
    CursorImage& image;                 ///< what is written, or read into
    double& timestamp;                  ///< seconds
    std::uint32_t entrySize = 0;        ///< bytes behind this field
    std::uint32_t justMetadataSize = 0; ///< bytes of the data part
};

/// Where a field's bytes are. No data and a size other than 0 means that memory for the field ran out.
struct FieldInfo {
    unsigned char* data; ///< inside the record or its image, valid as long as they are
    std::uint32_t size;  ///< in bytes
};

/// One field of an entry.
struct SchemaFieldStep {
    using Condition = bool (*)(const Record&);  ///< asked when the fields in front are known
    using FieldGetter = FieldInfo (*)(Record&); ///< called where the field is present

    std::string_view name;   ///< never stored
    std::int32_t minVersion; ///< of the streams that have the field
    std::int32_t maxVersion; ///< the last one that has it; 99 for any that may come
    Condition condition;     ///< whether the field is present in an entry
    FieldGetter fieldGetter; ///< where its bytes lie in memory

    /// Whether streams of this version have the field.
    constexpr bool existsIn(int version) const { return minVersion <= version && version <= maxVersion; }
};

/// The steps are constants, so a schema costs nothing to build and its lists outlive it.
class ZULMETADATA_API CursorImageSchema {
public:
    using Steps = std::span<const SchemaFieldStep>; ///< in the order in which the fields are stored

    /// Any version is accepted; below 1 and above 99 no step takes part.
    explicit CursorImageSchema(int version) : version_(version) {}
    CursorImageSchema(const CursorImageSchema&) = default;            ///< copies the version alone
    CursorImageSchema& operator=(const CursorImageSchema&) = default; ///< likewise
    virtual ~CursorImageSchema() = default;

    /// What every entry begins with: its size, time, identifier, and the data part's size.
    virtual Steps GetBaseInfoSteps() const;
    virtual Steps GetDataSteps() const; ///< the data part: the image and what belongs to it

    /// Fills in both sizes of the record from what its image holds.
    virtual void CalculateMetadataSizes(Record& record) const;

    /// Sums the steps that take part and are present. Calls their getters.
    std::uint32_t GetSizeOfSchemaFieldSteps(Steps steps, Record& record) const;

    /// Bytes of the record's image: in version 1, whose entries do not store it, what the data part leaves.
    std::uint32_t GetImageSize(const Record& record) const;

    bool AlwaysFn(const Record& record) const; ///< true: the condition of fields that no entry lacks

    /// Whether the record has, or while reading is about to get, an image.
    bool HasImageFn(const Record& record) const;

    /// The getter of the image's bytes. Where the image has a size but no data, it allocates a zeroed buffer of
    /// that size, which then belongs to the image.
    SchemaFieldStep::FieldGetter GetImageFieldInfoFn() const;

private:
    int version_;
};

} // namespace ZULMetaData
