#pragma once

// A stream buffer over something that is read in slices, each of which may cost a call into another world.

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <streambuf>
#include <vector>

namespace ZULMetaData::Bindings {

/// Gives how many bytes were read: fewer than asked for only where there are no more. Throws where reading fails.
using ReadSlice = std::function<std::size_t(std::uint64_t position, void* bytes, std::size_t size)>;

/// Reads whole blocks and keeps the ones used last. Walks from atom to atom touch a block here and there, and come
/// back to the first and the last ones.
class SliceBuffer final : public std::streambuf {
public:
    static constexpr std::size_t s_blockSize = std::size_t{1} << 16;

    SliceBuffer(ReadSlice read, std::uint64_t size) : read_(std::move(read)), size_(size) {}

protected:
    int_type underflow() override;
    std::streamsize xsgetn(char* bytes, std::streamsize count) override;
    pos_type seekoff(off_type offset, std::ios_base::seekdir direction, std::ios_base::openmode which) override;
    pos_type seekpos(pos_type position, std::ios_base::openmode which) override;

private:
    struct Block {
        std::vector<char> bytes;
        std::uint64_t start = 0;
        std::size_t held = 0;
        std::uint64_t lastUse = 0;
    };

    std::uint64_t position() const { return areaStart_ + static_cast<std::uint64_t>(gptr() - eback()); }
    void leaveAt(std::uint64_t position);
    Block& blockAt(std::uint64_t start);
    std::size_t readFully(std::uint64_t position, char* bytes, std::size_t size);

    ReadSlice read_;
    std::uint64_t size_;
    std::uint64_t areaStart_ = 0; // where the get area begins
    std::uint64_t uses_ = 0;
    std::array<Block, 16> blocks_;
};

} // namespace ZULMetaData::Bindings
