#pragma once

// What every writer of the family shares: the location of its stream file.

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"

#include <cstdint>

namespace ZULMetaData {

/// A writer reports nothing by itself: where its file cannot be created or written, what it is given is dropped. An
/// application asks `isHealthy` now and then. Used by one thread at a time; separate writers share nothing.
class ZULMETADATA_API BaseMetaDataWriter {
public:
    BaseMetaDataWriter() = default;
    BaseMetaDataWriter(const BaseMetaDataWriter&) = delete;
    BaseMetaDataWriter& operator=(const BaseMetaDataWriter&) = delete;
    virtual ~BaseMetaDataWriter() = default;

    /// Stores the location and runs `setup`, which creates the file. Gives the writer itself.
    BaseMetaDataWriter* initWithMetaDataFile(const FileLocation& file);

    /// Creates the stream writer; does nothing here.
    virtual void setup() {}

    /// Whether the file could be created, and everything since was taken. Once false (the disk is full, or something
    /// was written after the end), further entries are lost. Entries wait in the file's buffer until they are flushed
    /// or the file is closed, and have not met the disk before: ask again after `finish`.
    virtual bool isHealthy() const { return false; }

    /// Entries that were taken since the last `setup`. Where the writer is not healthy any more, those that were
    /// still in the buffer are counted though they are lost.
    virtual std::uint64_t entriesWritten() const { return 0; }

    const FileLocation& metaDataFile() const { return metaDataFile_; }       ///< the last one that was given
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; } ///< counts from the next `setup` on

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
