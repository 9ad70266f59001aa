#pragma once

// Errors of the operating system that name the file.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ByteSource.h"

#include <cstdint>
#include <span>
#include <string>
#include <system_error>

namespace ZULMetaData {

/// Why a file cannot be opened, read or written.
class ZULMETADATA_API FileError : public std::system_error {
public:
    /// `what()` returns the name of the file, a colon and what `error` says, as in "a.mp4: cannot be opened: No such
    /// file or directory".
    FileError(const std::string& file, const std::system_error& error)
        : std::system_error(error.code()), file_(file), sentence_(error.what()), text_(file + ": " + sentence_) {}

    const std::string& file() const { return file_; }                    ///< the name that the caller uses
    const std::string& sentence() const { return sentence_; }            ///< `what()` without the file
    const char* what() const noexcept override { return text_.c_str(); } ///< returns the whole sentence

private:
    std::string file_;
    std::string sentence_;
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

/// Returns the same bytes as a source whose errors name `file`.
inline ByteSource namedSource(const ByteSource& bytes, const std::string& file) {
    return {bytes.size(), [bytes, file](std::uint64_t position, std::span<char> to) {
                return orFileError(file, [&] { return bytes.read(position, to); });
            }};
}

/// Opens a file as a source whose errors name it. Throws `FileError` if it cannot be opened or is no regular file.
inline ByteSource openSource(const std::string& path, const std::string& name) {
    return namedSource(orFileError(name, [&path] { return ByteSource::file(path); }), name);
}

} // namespace ZULMetaData
