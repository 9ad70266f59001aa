#pragma once

// A file that tells whether the process that created it is still alive.

#include "Platform/Descriptor.h"
#include "Platform/FileLocation.h"
#include "SharedDependencies/Export.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// The file is locked before it gets its name, and stays locked until this object or its process ends. The system
/// releases the lock of a process that was killed, so neither a restart of the machine nor another process with the
/// same number is mistaken for it. Nobody but the owner may read or write the file.
class ZULMETADATA_API LockFile {
public:
    /// What became of the process that created a file.
    enum class State : std::uint8_t {
        Absent, ///< there is no such file
        Held,   ///< it is alive, or the file system cannot tell
        Left,   ///< it ended and did not remove the file
    };

    /// Creates the file with `note` in it, for people. The note is not empty; without locks the file is. Throws
    /// `std::system_error`, with `std::errc::file_exists` if there is such a file.
    LockFile(const FileLocation& file, std::string_view note);

    /// Looks at a file without waiting, and without keeping anybody else from looking.
    static State stateOf(const FileLocation& file);

    void remove(); ///< removes the file, if it is still there; without this it is left to others

private:
    /// Creates the file under a temporary name, whose last six characters the system replaces.
    LockFile(const FileLocation& file, std::string_view note, std::string&& temporary);

    FileLocation file_;
    Descriptor descriptor_;
};

} // namespace ZULMetaData
