#pragma once

// Errors of the operating system that name the file.

#include "../../SharedDependencies/Export.h"

#include <string>
#include <system_error>

namespace ZULMetaData {

/// Why a file cannot be opened, read or written.
class ZULMETADATA_API FileError : public std::system_error {
public:
    /// `what()` returns the name of the file, a colon and what `error` says, as in "a.mp4: cannot be opened: No such
    /// file or directory".
    FileError(const std::string& file, const std::system_error& error)
        : std::system_error(error.code()), file_(file), text_(file + ": " + error.what()) {}

    const std::string& file() const { return file_; }                    ///< the name that the file was given by
    const char* what() const noexcept override { return text_.c_str(); } ///< returns the whole sentence

private:
    std::string file_;
    std::string text_;
};

/// Returns what `work` returns. A `std::system_error` from it becomes a `FileError` that names `file`, unless it names
/// a file already.
template <class Work>
auto orFileError(const std::string& file, Work work) {
    try {
        return work();
    } catch (const FileError&) {
        throw;
    } catch (const std::system_error& error) {
        throw FileError(file, error);
    }
}

} // namespace ZULMetaData
