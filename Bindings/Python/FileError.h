#pragma once

// What the system says about a file that cannot be opened, read or written.

#include "Platform/FileLocation.h"

#include <system_error>

namespace ZULMetaData::Python {

/// Becomes an `OSError` with the file's name.
class FileError : public std::system_error {
public:
    FileError(const FileLocation& file, const std::error_code& reason) : std::system_error(reason), file_(file) {}

    /// For what the standard library does not tell more of than that it failed.
    static FileError ofErrno(const FileLocation& file);

    const FileLocation& file() const { return file_; }

private:
    FileLocation file_;
};

/// What `call` gives. Names the file where the library, or the system, does not.
template <class Call>
auto naming(const FileLocation& file, Call call) {
    try {
        return call();
    } catch (const FileError&) {
        throw;
    } catch (const std::system_error& error) {
        throw FileError(file, error.code());
    }
}

/// Lets Python catch `FileError` and `std::system_error` as `OSError`.
void registerFileErrors();

} // namespace ZULMetaData::Python
