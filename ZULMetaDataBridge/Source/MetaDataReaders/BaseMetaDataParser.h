#pragma once

// The base of all parsers: the location of the file, and how a stream is copied out of it.

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataCommon.h"

#include <memory>
#include <sstream>

namespace ZULMetaData {

/// The base class of the parsers. A parser opens its file only while it reads. One thread at a time may use a parser;
/// separate parsers share nothing.
class ZULMETADATA_API BaseMetaDataParser {
public:
    BaseMetaDataParser() = default;
    BaseMetaDataParser(const BaseMetaDataParser&) = delete;
    BaseMetaDataParser& operator=(const BaseMetaDataParser&) = delete;
    virtual ~BaseMetaDataParser() = default;

    /// Stores the location and calls `setup`. Does not open the file. Returns the parser itself.
    BaseMetaDataParser* initWithMetaDataFile(const FileLocation& file);

    virtual void setup() {} ///< does nothing; derived classes may override it

    /// Returns the bytes of the stream of this type, header included. They are empty if the file has no such stream,
    /// cannot be opened or is not a container.
    std::unique_ptr<std::stringstream> getMetaDataStream(uuid type) const;

    const FileLocation& metaDataFile() const { return metaDataFile_; }       ///< returns the location of the file
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; } ///< sets the file for the next `read`

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
