#pragma once

// Direct access to the put area and the get area of a stream buffer. Calling `write` or `read` on a stream costs five
// to twenty times as much as copying the 16 bytes of an entry. The areas are always left as the buffer itself would
// leave them, so the streams can be used normally at any time.

#include "../SharedDependencies/Export.h"

#include <cstddef>
#include <cstring>
#include <istream>
#include <ostream>
#include <streambuf>

namespace ZULMetaData::detail {

/// Gives access to the protected members of any stream buffer. A derived class may form pointers to these members, and
/// the pointers can be used on every stream buffer.
class StreamBufferAccess : private std::streambuf {
public:
    static std::size_t room(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::epptr)() - (buffer.*&StreamBufferAccess::pptr)());
    }
    static std::size_t capacity(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::epptr)() -
                                        (buffer.*&StreamBufferAccess::pbase)());
    }
    static char* putPosition(const std::streambuf& buffer) { return (buffer.*&StreamBufferAccess::pptr)(); }
    static void advancePut(std::streambuf& buffer, std::size_t count) {
        (buffer.*&StreamBufferAccess::pbump)(static_cast<int>(count));
    }

    /// Discards the bytes in the put area that have not been written out.
    static void discardPut(std::streambuf& buffer) {
        (buffer.*&StreamBufferAccess::pbump)(
            static_cast<int>((buffer.*&StreamBufferAccess::pbase)() - (buffer.*&StreamBufferAccess::pptr)()));
    }

    /// Shortens an empty put area by `less` bytes until it is written out for the first time.
    static void shortenPutArea(std::streambuf& buffer, std::size_t less) {
        if (room(buffer) == capacity(buffer) && room(buffer) > less)
            (buffer.*&StreamBufferAccess::setp)(putPosition(buffer), (buffer.*&StreamBufferAccess::epptr)() - less);
    }

    static std::size_t available(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::egptr)() - (buffer.*&StreamBufferAccess::gptr)());
    }
    /// Returns the number of bytes that were read and are still in the get area.
    static std::size_t passed(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::gptr)() - (buffer.*&StreamBufferAccess::eback)());
    }
    static const char* getPosition(const std::streambuf& buffer) { return (buffer.*&StreamBufferAccess::gptr)(); }
    static void advanceGet(std::streambuf& buffer, std::size_t count) {
        moveGet(buffer, static_cast<std::ptrdiff_t>(count));
    }

    /// Moves the read position by `distance`, which must stay inside the get area.
    static void moveGet(std::streambuf& buffer, std::ptrdiff_t distance) {
        (buffer.*&StreamBufferAccess::gbump)(static_cast<int>(distance));
    }
};

/// Returns the place for the next `size` bytes, or null if they do not fit into the put area. After the bytes are put
/// there, call `StreamBufferAccess::advancePut`.
inline char* placeFor(std::ostream& stream, std::size_t size) {
    const bool isPlain = stream.good() && !(stream.flags() & std::ios_base::unitbuf);
    std::streambuf& buffer = *stream.rdbuf();
    return isPlain && StreamBufferAccess::room(buffer) >= size ? StreamBufferAccess::putPosition(buffer) : nullptr;
}

/// Writes the bytes. Fills the put area to its end before it is written out, so all blocks have the same size.
ZULMETADATA_API void writeAcrossBlocks(std::ostream& stream, const char* bytes, std::size_t size);

/// Does the same as `stream.write`, at the cost of a copy if the put area has room.
inline void writeBytes(std::ostream& stream, const char* bytes, std::size_t size) {
    if (char* place = placeFor(stream, size)) {
        std::memcpy(place, bytes, size);
        StreamBufferAccess::advancePut(*stream.rdbuf(), size);
    } else {
        writeAcrossBlocks(stream, bytes, size);
    }
}

/// Does the same as `stream.read`, at the cost of a copy if the get area holds the bytes. Returns the number of bytes
/// read.
inline std::size_t readBytes(std::istream& stream, char* bytes, std::size_t size) {
    if (stream.good() && StreamBufferAccess::available(*stream.rdbuf()) >= size) {
        std::memcpy(bytes, StreamBufferAccess::getPosition(*stream.rdbuf()), size);
        StreamBufferAccess::advanceGet(*stream.rdbuf(), size);
        return size;
    }
    stream.read(bytes, static_cast<std::streamsize>(size));
    return static_cast<std::size_t>(stream.gcount());
}

/// Returns whether the input has ended, and sets the state as `stream.peek()` does, but costs less if the get area
/// holds another byte.
inline bool isAtEnd(std::istream& stream) {
    if (stream.good() && StreamBufferAccess::available(*stream.rdbuf()) > 0)
        return false;
    return stream.peek() == std::istream::traits_type::eof();
}

} // namespace ZULMetaData::detail
