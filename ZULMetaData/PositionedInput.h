#pragma once

// An input stream whose position is counted here and not queried, bounded by the size of its file.

#include "SharedDependencies/EndianFile.h"
#include "SharedDependencies/Export.h"
#include "ZULMetaData/StreamBufferAccess.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <istream>

namespace ZULMetaData::detail {

/// Uses a stream of the caller. Moving costs nothing, because the stream is moved when the next bytes are read.
class ZULMETADATA_API PositionedInput {
public:
    /// `position` is the current position of the stream.
    PositionedInput(std::istream& stream, std::uint64_t position, std::uint64_t total)
        : stream_(stream), streamPosition_(position), position_(position), total_(total) {}

    std::uint64_t position() const { return position_; }
    std::uint64_t total() const { return total_; }
    bool enoughBytesLeft(std::uint64_t needed) const { return total_ >= needed && position_ <= total_ - needed; }

    /// Returns false, and leaves the position, if no file position can hold `target`.
    bool moveTo(std::uint64_t target);

    /// Reads exactly `size` bytes. Returns false if they reach beyond the total or cannot be read.
    bool read(void* bytes, std::size_t size) { return readBuffered(bytes, size) || readStream(bytes, size); }

    template <class Integer>
    bool readBigEndian(Integer& value) {
        if (!read(&value, sizeof value))
            return false;
        value = swapInt(value);
        return true;
    }

private:
    bool readBuffered(void* bytes, std::size_t size);
    bool readStream(void* bytes, std::size_t size);
    void catchUp();

    std::istream& stream_;
    std::uint64_t streamPosition_;
    std::uint64_t position_;
    std::uint64_t total_;
};

/// Reads from the stream's get area, if it holds all bytes that are passed over and read. Almost every read of a walk
/// over small entries succeeds here, and so does a walk that goes back: an atom may end inside the header that was
/// read.
inline bool PositionedInput::readBuffered(void* bytes, std::size_t size) {
    std::streambuf& buffer = *stream_.rdbuf();
    const auto distance = static_cast<std::ptrdiff_t>(position_ - streamPosition_);
    const auto before = static_cast<std::ptrdiff_t>(StreamBufferAccess::passed(buffer));
    const auto available = static_cast<std::ptrdiff_t>(StreamBufferAccess::available(buffer));
    if (distance < -before || distance > available || size > static_cast<std::size_t>(available - distance) ||
        !enoughBytesLeft(size) || !stream_.good())
        return false;
    std::memcpy(bytes, StreamBufferAccess::getPosition(buffer) + distance, size);
    StreamBufferAccess::moveGet(buffer, distance + static_cast<std::ptrdiff_t>(size));
    position_ = streamPosition_ = position_ + size;
    return true;
}

} // namespace ZULMetaData::detail
