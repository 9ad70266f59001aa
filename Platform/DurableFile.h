#pragma once

// A file that is changed in place, at positions that the caller names, and that can be asked to be on the disk.
// Every failure is a `std::system_error` that says what could not be done, but not to which file.

#include "Platform/FileLocation.h"

#include <cstddef>
#include <cstdint>
#include <span>

namespace ZULMetaData {

/// Keeps others who open the file this way out as long as it lives; readers are not disturbed.
class DurableFile {
public:
    /// Opens a file that exists, for reading and writing. Throws for anything but a regular file, and where another
    /// one holds it open this way.
    explicit DurableFile(const FileLocation& file);
    ~DurableFile();
    DurableFile(const DurableFile&) = delete;
    DurableFile& operator=(const DurableFile&) = delete;

    std::uint64_t size() const;

    /// Returns whether this is still the file of that name. Another program may have removed or replaced it.
    bool isNamed(const FileLocation& file) const;

    /// Reads bytes and returns their number, which is smaller than asked for only at the end of the file.
    std::size_t readAt(std::uint64_t position, std::span<char> bytes) const;

    /// Writes all of `bytes`, or throws with some of them written.
    void writeAt(std::uint64_t position, std::span<const char> bytes);

    /// Cuts the file off, or fills it up with zeros.
    void truncate(std::uint64_t size);

    /// Returns when the file's bytes and size are on the disk, as far as the system can tell.
    void sync();

private:
    int descriptor_;
};

} // namespace ZULMetaData
