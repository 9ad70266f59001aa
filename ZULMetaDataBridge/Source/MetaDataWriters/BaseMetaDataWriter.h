#pragma once

// The base of all writers: the location of the stream file.

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"

#include <cstdint>

namespace ZULMetaData {

/// The base class of the writers. A writer does not report errors: if its file cannot be created or written, it drops
/// its entries. An application should call `isHealthy` now and then. One thread at a time may use a writer; separate
/// writers share nothing.
class ZULMETADATA_API BaseMetaDataWriter {
public:
    BaseMetaDataWriter() = default;
    BaseMetaDataWriter(const BaseMetaDataWriter&) = delete;
    BaseMetaDataWriter& operator=(const BaseMetaDataWriter&) = delete;
    virtual ~BaseMetaDataWriter() = default;

    /// Stores the location and calls `setup`, which creates the file. Returns the writer itself.
    BaseMetaDataWriter* initWithMetaDataFile(const FileLocation& file);

    /// Creates the stream writer and its file. Does nothing in this class.
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

    const FileLocation& metaDataFile() const { return metaDataFile_; }       ///< returns the location of the file
    void setMetaDataFile(const FileLocation& file) { metaDataFile_ = file; } ///< sets the file for the next `setup`

private:
    FileLocation metaDataFile_;
};

} // namespace ZULMetaData
