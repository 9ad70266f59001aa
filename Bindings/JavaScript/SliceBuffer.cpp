#include "Bindings/JavaScript/SliceBuffer.h"

#include <algorithm>
#include <cstring>

namespace ZULMetaData::Bindings {

/// Without a get area: the next byte is looked up.
void SliceBuffer::leaveAt(std::uint64_t position) {
    setg(nullptr, nullptr, nullptr);
    areaStart_ = position;
}

std::size_t SliceBuffer::readFully(std::uint64_t position, char* bytes, std::size_t size) {
    std::size_t done = 0;
    while (done < size) {
        const std::size_t got = read_(position + done, bytes + done, size - done);
        if (got == 0)
            break;
        done += std::min(got, size - done);
    }
    return done;
}

SliceBuffer::Block& SliceBuffer::blockAt(std::uint64_t start) {
    const auto isWanted = [&](const Block& block) { return block.held > 0 && block.start == start; };
    auto block = std::find_if(blocks_.begin(), blocks_.end(), isWanted);
    if (block == blocks_.end()) {
        block = std::min_element(blocks_.begin(), blocks_.end(),
                                 [](const Block& left, const Block& right) { return left.lastUse < right.lastUse; });
        block->held = 0;
        block->bytes.resize(s_blockSize);
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(s_blockSize, size_ - start));
        block->held = readFully(start, block->bytes.data(), wanted);
        block->start = start;
    }
    block->lastUse = ++uses_;
    return *block;
}

SliceBuffer::int_type SliceBuffer::underflow() {
    if (gptr() < egptr())
        return traits_type::to_int_type(*gptr());
    const std::uint64_t at = position();
    leaveAt(at);
    if (at >= size_)
        return traits_type::eof();
    const std::uint64_t start = at / s_blockSize * s_blockSize;
    Block& block = blockAt(start);
    const auto inside = static_cast<std::size_t>(at - start);
    if (inside >= block.held)
        return traits_type::eof();
    char* begin = block.bytes.data();
    setg(begin, begin + inside, begin + block.held);
    areaStart_ = start;
    return traits_type::to_int_type(*gptr());
}

/// What is larger than a block goes straight to its place, and leaves the blocks alone.
std::streamsize SliceBuffer::xsgetn(char* bytes, std::streamsize count) {
    std::streamsize done = 0;
    while (done < count) {
        const std::streamsize left = count - done;
        if (gptr() == egptr() && left >= static_cast<std::streamsize>(s_blockSize)) {
            const std::uint64_t at = position();
            const std::uint64_t held = at < size_ ? size_ - at : 0;
            const auto wanted =
                static_cast<std::size_t>(std::min<std::uint64_t>(held, static_cast<std::uint64_t>(left)));
            const std::size_t got = readFully(at, bytes + done, wanted);
            leaveAt(at + got);
            return done + static_cast<std::streamsize>(got);
        }
        if (traits_type::eq_int_type(underflow(), traits_type::eof()))
            break;
        const std::streamsize piece = std::min<std::streamsize>(left, egptr() - gptr());
        std::memcpy(bytes + done, gptr(), static_cast<std::size_t>(piece));
        gbump(static_cast<int>(piece));
        done += piece;
    }
    return done;
}

/// Like a file, lets itself be put behind its end, where nothing can be read.
SliceBuffer::pos_type SliceBuffer::seekoff(off_type offset, std::ios_base::seekdir direction,
                                           std::ios_base::openmode which) {
    const auto base = direction == std::ios_base::beg   ? off_type{0}
                      : direction == std::ios_base::cur ? static_cast<off_type>(position())
                                                        : static_cast<off_type>(size_);
    off_type target = 0;
    if (__builtin_add_overflow(base, offset, &target))
        return pos_type(off_type{-1});
    return seekpos(pos_type(target), which);
}

SliceBuffer::pos_type SliceBuffer::seekpos(pos_type position, std::ios_base::openmode) {
    const auto target = static_cast<off_type>(position);
    if (target < 0)
        return pos_type(off_type{-1});
    const auto wanted = static_cast<std::uint64_t>(target);
    const auto areaSize = static_cast<std::uint64_t>(egptr() - eback());
    if (wanted >= areaStart_ && wanted - areaStart_ < areaSize)
        setg(eback(), eback() + (wanted - areaStart_), egptr());
    else
        leaveAt(wanted);
    return position;
}

} // namespace ZULMetaData::Bindings
