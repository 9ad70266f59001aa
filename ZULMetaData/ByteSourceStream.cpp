#include "ZULMetaData/ByteSourceStream.h"

#include <algorithm>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_smallestBlock = 2048;
constexpr std::size_t s_largestBlock = 65536;

} // namespace

ByteSourceStream::ByteSourceStream(ByteSource source)
    : std::istream(static_cast<std::streambuf*>(this)), source_(std::move(source)) {}

std::streambuf::int_type ByteSourceStream::underflow() {
    blockSize_ = blockSize_ == 0 ? s_smallestBlock : std::min(2 * blockSize_, s_largestBlock);
    block_.resize(blockSize_);
    const std::size_t size = source_.read(blockEnd_, block_);
    setg(block_.data(), block_.data(), block_.data() + size);
    blockEnd_ += size;
    return size == 0 ? std::streambuf::traits_type::eof() : std::streambuf::traits_type::to_int_type(*gptr());
}

/// A position after the end can be reached, as in a file; nothing can be read there.
std::streambuf::pos_type ByteSourceStream::seekoff(std::streambuf::off_type offset, std::ios_base::seekdir from,
                                                   std::ios_base::openmode which) {
    const std::uint64_t base = from == std::ios_base::beg   ? 0
                               : from == std::ios_base::cur ? position()
                                                            : source_.size();
    return seekpos(std::streambuf::pos_type(static_cast<std::streambuf::off_type>(base) + offset), which);
}

std::streambuf::pos_type ByteSourceStream::seekpos(std::streambuf::pos_type position, std::ios_base::openmode) {
    const auto target = static_cast<std::streambuf::off_type>(position);
    if (target < 0)
        return std::streambuf::pos_type(std::streambuf::off_type{-1});
    const std::streambuf::off_type distance =
        target - static_cast<std::streambuf::off_type>(blockEnd_); // from the end of the block
    if (distance <= 0 && -distance <= egptr() - eback()) {
        setg(eback(), egptr() + distance, egptr());
    } else {
        setg(nullptr, nullptr, nullptr);
        blockEnd_ = static_cast<std::uint64_t>(target);
        blockSize_ = 0;
    }
    return position;
}

} // namespace ZULMetaData
