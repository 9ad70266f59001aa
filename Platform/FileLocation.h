#pragma once

// The location of a file. Applications pass a location; the stream core uses the bytes of its path.

#include <filesystem>
#include <string>

namespace ZULMetaData {

using FileLocation = std::filesystem::path; ///< an absolute path, or one relative to the working directory

/// Returns the path as UTF-8. A POSIX path is returned byte for byte even if it is not valid UTF-8, so every existing
/// file can be opened.
inline std::string utf8Path(const FileLocation& location) {
    return location.native();
}

} // namespace ZULMetaData
