#pragma once

// Reads a file in blocks that are small after a seek and grow while bytes are read in sequence. A walk over headers
// that lie far apart needs small blocks and a list of a million entries needs large ones, but the buffer of a file
// keeps the size with which it was opened. In a sparse movie of 200,000 atoms, blocks of 8 KiB take 1.3 times as long
// as these, and blocks of 64 KiB seven times.

#include <array>
#include <cstddef>
#include <fstream>
#include <memory>
#include <streambuf>

namespace ZULMetaData::detail {

/// Reads a file in larger blocks and seeks lazily. The stream on top returns the same bytes and ends in the same state
/// as without this buffer.
class FileInputBuffer final : public std::streambuf {
public:
    /// `file` must not be open yet, and must outlive this object. Open and close it as usual.
    explicit FileInputBuffer(std::filebuf& file);

    /// Call this after closing the file.
    void forget();

protected:
    int_type underflow() override;
    std::streamsize xsgetn(char* bytes, std::streamsize size) override;
    std::streamsize showmanyc() override;
    pos_type seekoff(off_type offset, std::ios_base::seekdir from, std::ios_base::openmode which) override;
    pos_type seekpos(pos_type position, std::ios_base::openmode which) override;

private:
    static constexpr std::size_t s_smallestBlock = 2048;
    static constexpr std::size_t s_largestBlock = 65536;

    off_type position() const { return blockEnd_ - (egptr() - gptr()); }
    pos_type moveTo(off_type position);
    pos_type startAt(pos_type position);
    bool catchUp();
    std::size_t read(char* bytes, std::size_t size);
    void readBlock();
    void readSmallestBlock();
    void leaveAt(off_type position, bool isAtEnd);

    std::filebuf& file_;
    std::array<char, s_smallestBlock> fileBlock_; // the buffer of `file_`
    std::unique_ptr<char[]> block_;               // for larger blocks
    std::size_t blockSize_ = s_smallestBlock;
    off_type blockEnd_ = 0;
    off_type filePosition_ = 0; // of `file_`; -1 after a failure or the end of the file
    off_type fileEnd_ = -1;     // when it was last determined
};

} // namespace ZULMetaData::detail
