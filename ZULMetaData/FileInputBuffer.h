#pragma once

// Reads a file in blocks that are small behind a seek and grow where bytes follow one another: a walk over headers far
// apart and a list of a million entries want different ones, and the buffer of a file keeps the one that it opened
// with. In a sparse movie of 200,000 atoms blocks of 8 KiB take 1.3 times as long as these, 64 KiB seven times.

#include <array>
#include <cstddef>
#include <fstream>
#include <memory>
#include <streambuf>

namespace ZULMetaData::detail {

/// Stands between a stream and the buffer of its file; what the stream gives, and the state that it ends in, stay.
class FileInputBuffer final : public std::streambuf {
public:
    /// `file` is not open yet and outlives this. It is opened and closed as if it stood alone.
    explicit FileInputBuffer(std::filebuf& file);

    /// To be called behind the closing of the file.
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
    std::array<char, s_smallestBlock> fileBlock_; // of `file_`
    std::unique_ptr<char[]> block_;               // for all but the smallest
    std::size_t blockSize_ = s_smallestBlock;
    off_type blockEnd_ = 0;
    off_type filePosition_ = 0; // of `file_`; -1 where a failure or the end was met on the way
    off_type fileEnd_ = -1;     // as it was last asked for
};

} // namespace ZULMetaData::detail
