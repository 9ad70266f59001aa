#pragma once

// Bytes that can be read at any position: a file, a stream of the caller, memory, or a part of one of these. Everything
// that reads a file without trusting it reads it through a source.
//
//     const ByteSource movie = ByteSource::file("Recording.mp4");
//     std::array<char, 8> header;
//     if (movie.read(0, header) == header.size())
//         std::cout << movie.size() << " bytes\n";

#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <limits>
#include <span>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// Copies share what they read from. They must not be used by two threads at once.
class ZULMETADATA_API ByteSource {
public:
    /// Reads bytes at a position and returns their number. It may return fewer than `bytes.size()` only at the end of
    /// the source. Throws `std::system_error` if reading fails.
    using Read = Callback<std::size_t(std::uint64_t position, std::span<char> bytes)>;

    ByteSource(std::uint64_t size, Read read); ///< reads with a function of the caller

    /// Opens a file and keeps it open. Throws `std::system_error` if it cannot be opened or is no regular file.
    static ByteSource file(const std::string& path);

    /// Reads a stream of the caller, which must outlive the source. The stream's state is cleared before every read
    /// and its position is changed. Throws `std::system_error` if the size of the stream cannot be determined.
    static ByteSource stream(std::istream& input);

    static ByteSource memory(std::string_view bytes); ///< reads bytes of the caller, which must outlive the source

    std::uint64_t size() const { return size_; } ///< returns the number of bytes

    /// Reads bytes at `position` and returns their number, which is smaller than asked for only at the end. Throws
    /// `std::system_error` if reading fails.
    std::size_t read(std::uint64_t position, std::span<char> bytes) const;

    /// Returns `size` bytes from `offset` on as a source of its own, or fewer if this one ends before.
    ByteSource part(std::uint64_t offset, std::uint64_t size = std::numeric_limits<std::uint64_t>::max()) const;

private:
    Read read_;
    std::uint64_t begin_ = 0; ///< of this part in what `read_` reads
    std::uint64_t size_;
};

/// Throws `std::system_error` if `input` has failed for another reason than its end. Otherwise bytes that cannot be
/// read would be taken for bytes that do not exist.
ZULMETADATA_API void requireReadable(const std::istream& input);

} // namespace ZULMetaData
