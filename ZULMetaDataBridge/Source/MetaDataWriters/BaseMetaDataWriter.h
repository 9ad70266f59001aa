#pragma once

// What every writer of the family shares: the location of its stream file.

#include "Platform/FileLocation.h"

namespace ZULMetaData {

/// A writer reports nothing: where its file cannot be created or written, what it is given is dropped. Used by
/// one thread at a time; separate writers share nothing.
class BaseMetaDataWriter {
public:
    BaseMetaDataWriter() = default;
    BaseMetaDataWriter(const BaseMetaDataWriter&) = delete;
    BaseMetaDataWriter& operator=(const BaseMetaDataWriter&) = delete;
    virtual ~BaseMetaDataWriter() = default;

    /// Stores the location and runs `setup`, which creates the file. Gives the writer itself.
    BaseMetaDataWriter* initWithMetaDataFile(const FileLocation& file);

    /// Creates the stream writer; does nothing here.
    virtual void setup() {}

    const FileLocation& metaDataFile() const { return metaDataFile_; }
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; }

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
