#include "ZULMetaData/FileInputBuffer.h"

#include "ZULMetaData/StreamBufferAccess.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <system_error>

namespace ZULMetaData::detail {

namespace {

const std::streampos s_none = std::streamoff(-1);

} // namespace

FileInputBuffer::FileInputBuffer(std::filebuf& file) : file_(file) {
    file_.pubsetbuf(fileBlock_.data(), s_smallestBlock);
}

void FileInputBuffer::forget() {
    startAt(0);
    filePosition_ = 0;
    fileEnd_ = -1;
}

FileInputBuffer::int_type FileInputBuffer::underflow() {
    if (gptr() == egptr()) {
        if (!catchUp())
            return traits_type::eof();
        readBlock();
    }
    return gptr() == egptr() ? traits_type::eof() : traits_type::to_int_type(*gptr());
}

std::streamsize FileInputBuffer::xsgetn(char* bytes, std::streamsize size) {
    std::streamsize done = 0;
    while (done < size) {
        const std::streamsize rest = size - done;
        if (gptr() == egptr() && rest >= static_cast<std::streamsize>(s_largestBlock)) {
            if (!catchUp())
                break;
            setg(nullptr, nullptr, nullptr);
            const std::size_t got = read(bytes + done, static_cast<std::size_t>(rest));
            return done + static_cast<std::streamsize>(got);
        }
        if (gptr() == egptr() && underflow() == traits_type::eof())
            break;
        const std::streamsize piece = std::min<std::streamsize>(egptr() - gptr(), rest);
        std::memcpy(bytes + done, gptr(), static_cast<std::size_t>(piece));
        gbump(static_cast<int>(piece));
        done += piece;
    }
    return done;
}

std::streamsize FileInputBuffer::showmanyc() {
    return catchUp() ? file_.in_avail() : -1;
}

FileInputBuffer::pos_type FileInputBuffer::seekoff(off_type offset, std::ios_base::seekdir from,
                                                   std::ios_base::openmode) {
    if (!file_.is_open())
        return s_none;
    if (from == std::ios_base::beg)
        return moveTo(offset);
    if (from == std::ios_base::end) {
        const pos_type found = file_.pubseekoff(offset, from);
        if (found == s_none)
            return s_none;
        filePosition_ = found;
        fileEnd_ = filePosition_ - offset;
        return startAt(found);
    }
    if (offset == 0)
        return position();
    const bool isTooFar = offset > 0 && position() > std::numeric_limits<off_type>::max() - offset;
    return isTooFar ? s_none : moveTo(position() + offset);
}

FileInputBuffer::pos_type FileInputBuffer::seekpos(pos_type position, std::ios_base::openmode) {
    return file_.is_open() ? moveTo(position) : s_none;
}

/// Defers the seek of the file until bytes are read, if the position is known to lie inside the file.
FileInputBuffer::pos_type FileInputBuffer::moveTo(off_type position) {
    if (position < 0 || position > fileEnd_) {
        if (file_.pubseekpos(position) == s_none)
            return s_none;
        filePosition_ = position;
    }
    return startAt(position);
}

FileInputBuffer::pos_type FileInputBuffer::startAt(pos_type position) {
    setg(nullptr, nullptr, nullptr);
    blockEnd_ = position;
    blockSize_ = s_smallestBlock;
    return position;
}

bool FileInputBuffer::catchUp() {
    if (filePosition_ == blockEnd_)
        return true;
    if (!file_.is_open())
        return false;
    if (file_.pubseekpos(blockEnd_) == s_none) // reported here because the seek itself was deferred
        throw std::ios_base::failure("cannot be read", std::make_error_code(std::errc::io_error));
    filePosition_ = blockEnd_;
    return true;
}

/// Reads the bytes that follow the block.
std::size_t FileInputBuffer::read(char* bytes, std::size_t size) {
    filePosition_ = -1;
    const std::streamsize got = file_.sgetn(bytes, static_cast<std::streamsize>(size));
    leaveAt(blockEnd_ + got, got < static_cast<std::streamsize>(size));
    return static_cast<std::size_t>(got);
}

void FileInputBuffer::readBlock() {
    if (blockSize_ > s_smallestBlock) {
        if (!block_)
            block_.reset(new char[s_largestBlock]); // not cleared: a walk over atoms never needs it
        try {
            setg(nullptr, nullptr, nullptr);
            const std::size_t got = read(block_.get(), blockSize_);
            setg(block_.get(), block_.get(), block_.get() + got);
        } catch (const std::ios_base::failure&) { // smaller blocks still reach the bytes before the bad place
            blockSize_ = s_smallestBlock;
            if (!catchUp())
                return;
        }
    }
    if (gptr() == egptr() && blockSize_ == s_smallestBlock)
        readSmallestBlock();
    blockSize_ = std::min(4 * blockSize_, s_largestBlock);
}

/// Uses the bytes in the file's own buffer in place.
void FileInputBuffer::readSmallestBlock() {
    filePosition_ = -1;
    setg(nullptr, nullptr, nullptr);
    const bool isThere = file_.sgetc() != traits_type::eof();
    const std::size_t size = isThere ? StreamBufferAccess::available(file_) : 0;
    char* start = size > 0 ? fileBlock_.data() + (StreamBufferAccess::getPosition(file_) - fileBlock_.data()) : nullptr;
    StreamBufferAccess::advanceGet(file_, size);
    setg(start, start, start + size);
    leaveAt(blockEnd_ + static_cast<off_type>(size), size == 0);
}

/// After the end of the file was met, a standard library may have to seek before it sees bytes that are written later.
void FileInputBuffer::leaveAt(off_type position, bool isAtEnd) {
    blockEnd_ = position;
    filePosition_ = isAtEnd ? -1 : position;
}

} // namespace ZULMetaData::detail
