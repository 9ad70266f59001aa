#pragma once

// Where a file lies. An application hands over a location; the stream core wants the bytes of its path.

#include <filesystem>
#include <string>

namespace ZULMetaData {

using FileLocation = std::filesystem::path; ///< absolute, or relative to the working directory

/// The file-system path as UTF-8. POSIX paths are handed on byte for byte, also where they are not valid UTF-8,
/// so that every file that exists can be opened.
inline std::string utf8Path(const FileLocation& location) {
    return location.native();
}

} // namespace ZULMetaData
