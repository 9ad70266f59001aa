#pragma once

// A file that is changed in place, at positions that the caller names, and that can be asked to be on the disk.

#include "Platform/Descriptor.h"
#include "Platform/FileLocation.h"
#include "SharedDependencies/Export.h"

#include <cstdint>

namespace ZULMetaData {

/// Keeps out others who open the file this way as long as it lives. Readers are not disturbed. Every failure is a
/// `std::system_error`, as with a `Descriptor`.
class ZULMETADATA_API DurableFile : Descriptor {
public:
    /// Opens a file that exists, for reading and writing. Throws for anything but a regular file, and if another
    /// program holds it open this way.
    explicit DurableFile(const FileLocation& file);

    using Descriptor::readAt;
    using Descriptor::truncate;
    using Descriptor::writeAt;

    std::uint64_t size() const;

    /// Returns whether this is still the file of that name. Another program may have removed or replaced it.
    bool isNamed(const FileLocation& file) const;

    /// Returns when the file's bytes and size are on the disk, as far as the system can tell.
    void sync();
};

} // namespace ZULMetaData
