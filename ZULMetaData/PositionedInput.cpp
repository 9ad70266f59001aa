#include "ZULMetaData/PositionedInput.h"

#include <limits>

namespace ZULMetaData::detail {

namespace {

/// Seeking a file discards its buffer. It is cheaper to read over a shorter distance.
constexpr std::uint64_t s_readOverLimit = 2048;

constexpr std::uint64_t s_lastPosition = std::numeric_limits<std::streamoff>::max();

} // namespace

bool PositionedInput::moveTo(std::uint64_t target) {
    if (target > s_lastPosition)
        return false;
    position_ = target;
    return true;
}

void PositionedInput::catchUp() {
    const std::uint64_t distance = position_ - streamPosition_; // huge if the target lies before the position
    if (distance == 0)
        return;
    if (distance <= s_readOverLimit)
        stream_.ignore(static_cast<std::streamsize>(distance));
    else
        stream_.seekg(static_cast<std::streamoff>(position_));
    streamPosition_ = position_;
}

bool PositionedInput::readStream(void* bytes, std::size_t size) {
    if (!enoughBytesLeft(size))
        return false;
    catchUp();
    stream_.read(static_cast<char*>(bytes), static_cast<std::streamsize>(size));
    const auto got = static_cast<std::uint64_t>(stream_.gcount());
    position_ = streamPosition_ += got;
    return got == size;
}

} // namespace ZULMetaData::detail
