#pragma once

// What every writer of the family shares: the location of its stream file.

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"

#include <cstdint>

namespace ZULMetaData {

/// A writer reports nothing by itself. If its file cannot be created or written, the writer drops what it is given. An
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

    /// Returns true if the file could be created and every entry since was accepted at a finite time. After an entry
    /// was lost (the disk is full, or the entry was written after the end), later entries are lost too. An entry whose
    /// time is infinite or not a number, such as that of a default `MediaTime`, is written as it is, and so are the
    /// entries after it, but this returns false until the next `setup`.
    ///
    /// Entries wait in the file's buffer until they are flushed or the file is closed. A full disk is not noticed
    /// before that: ask again after `finish`.
    virtual bool isHealthy() const { return false; }

    /// Returns the number of entries that the file accepted since the last `setup`. If the file failed, this includes
    /// entries that were still in its buffer, though they are lost.
    virtual std::uint64_t entriesWritten() const { return 0; }

    const FileLocation& metaDataFile() const { return metaDataFile_; }       ///< the last one that was given
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; } ///< counts from the next `setup` on

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
