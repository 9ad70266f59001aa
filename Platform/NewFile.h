#pragma once

// A stream buffer that writes a file which it creates. Unlike `std::filebuf` it replaces no file, keeps the file
// private, writes nothing after a failure, and knows why it failed.

#include "Platform/Descriptor.h"
#include "Platform/FileLocation.h"
#include "SharedDependencies/Export.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <streambuf>
#include <string>

namespace ZULMetaData {

/// Bytes reach the file when the buffer is full, when the stream is flushed, and in `close`. Only the owner may read or
/// write the file.
class ZULMETADATA_API NewFile : public std::streambuf {
public:
    /// Throws `std::system_error`, with `std::errc::file_exists` if there is a file of that name, even a link.
    explicit NewFile(const FileLocation& file);

    /// Writes what is in the buffer and closes the file. Nothing can be written afterwards. Returns whether every byte
    /// reached the file.
    bool close();

    bool hasUnwritten() const { return pptr() != pbase(); } ///< returns whether the buffer holds bytes

    /// Returns what failed, such as "cannot be written at offset 512: No space left on device", or an empty text.
    const std::string& failure() const { return failure_; }

protected:
    int_type overflow(int_type next) override;
    int sync() override;

private:
    static constexpr std::size_t s_bufferSize = std::size_t{64} * 1024;
    static constexpr std::size_t s_pageSize = 4096;

    bool writeOut();
    void fail(const char* reason);

    std::unique_ptr<char[]> buffer_;
    Descriptor file_;
    std::uint64_t written_ = 0;
    std::string failure_;
};

} // namespace ZULMetaData
