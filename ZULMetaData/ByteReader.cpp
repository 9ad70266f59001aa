#include "ZULMetaData/ByteReader.h"

#include <algorithm>
#include <utility>

namespace ZULMetaData::detail {

namespace {

/// Headers may lie far apart, and entries follow one another: the window is small after a jump and grows as long as the
/// reads follow one another. In a sparse movie of 200,000 atoms, windows of 64 KiB take seven times as long. A distance
/// below the smallest window is no jump: headers that lie so near each other are read faster in large blocks.
constexpr std::size_t s_smallestBlock = 2048;
constexpr std::size_t s_largestBlock = 65536;

} // namespace

std::string_view ByteReader::refilled(std::uint64_t position, std::uint64_t size) {
    const std::uint64_t left = source_.size() - std::min(position, source_.size());
    const std::uint64_t wanted = std::min(size, left);
    const std::uint64_t windowEnd = windowStart_ + window_.size();
    const bool isNext = position >= windowStart_ && position < windowEnd + s_smallestBlock && !window_.empty();
    if (position < windowStart_ || position > windowEnd || wanted > windowEnd - position) {
        blockSize_ = isNext ? std::min(2 * blockSize_, s_largestBlock) : s_smallestBlock;
        const auto count = static_cast<std::size_t>(std::min(std::max<std::uint64_t>(wanted, blockSize_), left));
        std::vector<char> window = std::exchange(window_, {}); // it stays empty if reading fails
        const bool isTooLarge = window.capacity() > 2 * s_largestBlock && count <= s_largestBlock;
        if (window.capacity() < count ||
            isTooLarge) // no larger than needed, and a large piece does not keep its memory
            window = std::vector<char>(count);
        window.resize(count);
        window.resize(source_.read(position, window));
        window_ = std::move(window);
        windowStart_ = position;
    }
    const auto start = static_cast<std::size_t>(position - windowStart_);
    return {window_.data() + start, std::min(static_cast<std::size_t>(wanted), window_.size() - start)};
}

} // namespace ZULMetaData::detail
