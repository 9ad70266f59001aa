#pragma once

// What every parser of the family shares: the location of its file, and how a stream is copied out of it.

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataCommon.h"

#include <memory>
#include <sstream>

namespace ZULMetaData {

/// Opens its file only while it reads. Used by one thread at a time; separate parsers share nothing.
class ZULMETADATA_API BaseMetaDataParser {
public:
    BaseMetaDataParser() = default;
    BaseMetaDataParser(const BaseMetaDataParser&) = delete;
    BaseMetaDataParser& operator=(const BaseMetaDataParser&) = delete;
    virtual ~BaseMetaDataParser() = default;

    /// Stores the location and runs `setup`. Does not touch the file. Gives the parser itself.
    BaseMetaDataParser* initWithMetaDataFile(const FileLocation& file);

    virtual void setup() {} ///< does nothing here

    /// The bytes of the file's stream of this type, header included; empty where the file has none, cannot be
    /// opened or is no container.
    std::unique_ptr<std::stringstream> getMetaDataStream(uuid type) const;

    const FileLocation& metaDataFile() const { return metaDataFile_; }       ///< the last one that was given
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; } ///< counts from the next `read` on

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
