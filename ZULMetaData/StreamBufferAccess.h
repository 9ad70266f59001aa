#pragma once

// The inside of a stream buffer: bytes go straight into its put area and come straight out of its get area. A call
// of `write` or `read` on a stream costs five to twenty times as much as the 16 bytes of an entry that it moves.
// The streams stay usable by anybody in between, for the areas are always left as the buffer itself would leave them.

#include "../SharedDependencies/Export.h"

#include <cstddef>
#include <cstring>
#include <istream>
#include <ostream>
#include <streambuf>

namespace ZULMetaData::detail {

/// Names the protected members of a stream buffer from within a class derived from it, which is what makes pointers
/// to them usable on any stream buffer.
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

    /// Forgets what was put but not yet written out.
    static void discardPut(std::streambuf& buffer) {
        (buffer.*&StreamBufferAccess::pbump)(
            static_cast<int>((buffer.*&StreamBufferAccess::pbase)() - (buffer.*&StreamBufferAccess::pptr)()));
    }

    /// Takes `less` bytes off an empty put area until it is written out for the first time.
    static void shortenPutArea(std::streambuf& buffer, std::size_t less) {
        if (room(buffer) == capacity(buffer) && room(buffer) > less)
            (buffer.*&StreamBufferAccess::setp)(putPosition(buffer), (buffer.*&StreamBufferAccess::epptr)() - less);
    }

    static std::size_t available(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::egptr)() - (buffer.*&StreamBufferAccess::gptr)());
    }
    /// Read already, and still there.
    static std::size_t passed(const std::streambuf& buffer) {
        return static_cast<std::size_t>((buffer.*&StreamBufferAccess::gptr)() - (buffer.*&StreamBufferAccess::eback)());
    }
    static const char* getPosition(const std::streambuf& buffer) { return (buffer.*&StreamBufferAccess::gptr)(); }
    static void advanceGet(std::streambuf& buffer, std::size_t count) {
        moveGet(buffer, static_cast<std::ptrdiff_t>(count));
    }

    /// By no more than is available or passed.
    static void moveGet(std::streambuf& buffer, std::ptrdiff_t distance) {
        (buffer.*&StreamBufferAccess::gbump)(static_cast<int>(distance));
    }
};

/// Where `size` bytes can be put right now, to be followed by `StreamBufferAccess::advancePut`; else null.
inline char* placeFor(std::ostream& stream, std::size_t size) {
    const bool isPlain = stream.good() && !(stream.flags() & std::ios_base::unitbuf);
    std::streambuf& buffer = *stream.rdbuf();
    return isPlain && StreamBufferAccess::room(buffer) >= size ? StreamBufferAccess::putPosition(buffer) : nullptr;
}

/// Fills the put area to its end before it is written out, so that blocks keep one size.
ZULMETADATA_API void writeAcrossBlocks(std::ostream& stream, const char* bytes, std::size_t size);

/// As `stream.write`, at the cost of a copy where the put area has room.
inline void writeBytes(std::ostream& stream, const char* bytes, std::size_t size) {
    if (char* place = placeFor(stream, size)) {
        std::memcpy(place, bytes, size);
        StreamBufferAccess::advancePut(*stream.rdbuf(), size);
    } else {
        writeAcrossBlocks(stream, bytes, size);
    }
}

/// As `stream.read`, at the cost of a copy where the get area holds the bytes. Gives how many have been read.
inline std::size_t readBytes(std::istream& stream, char* bytes, std::size_t size) {
    if (stream.good() && StreamBufferAccess::available(*stream.rdbuf()) >= size) {
        std::memcpy(bytes, StreamBufferAccess::getPosition(*stream.rdbuf()), size);
        StreamBufferAccess::advanceGet(*stream.rdbuf(), size);
        return size;
    }
    stream.read(bytes, static_cast<std::streamsize>(size));
    return static_cast<std::size_t>(stream.gcount());
}

/// Whether the end of the input comes next. As `stream.peek()`, which then sets the state, but without its cost where
/// the get area holds another byte.
inline bool isAtEnd(std::istream& stream) {
    if (stream.good() && StreamBufferAccess::available(*stream.rdbuf()) > 0)
        return false;
    return stream.peek() == std::istream::traits_type::eof();
}

} // namespace ZULMetaData::detail
