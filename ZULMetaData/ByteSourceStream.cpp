#include "ZULMetaData/ByteSourceStream.h"

#include <utility>

namespace ZULMetaData {

ByteSourceStream::ByteSourceStream(ByteSource source)
    : std::istream(static_cast<std::streambuf*>(this)), reader_(std::move(source)) {
    exceptions(std::ios_base::badbit); // passes on what the source throws
}

void ByteSourceStream::close() {
    setg(nullptr, nullptr, nullptr);
    reader_ = detail::ByteReader(ByteSource::memory({}));
}

std::streambuf::int_type ByteSourceStream::underflow() {
    const std::string_view bytes = reader_.from(blockEnd_);
    char* begin = const_cast<char*>(bytes.data()); // never written to
    setg(begin, begin, begin + bytes.size());
    blockEnd_ += bytes.size();
    return bytes.empty() ? std::streambuf::traits_type::eof() : std::streambuf::traits_type::to_int_type(*gptr());
}

std::streambuf::pos_type ByteSourceStream::seekoff(std::streambuf::off_type offset, std::ios_base::seekdir from,
                                                   std::ios_base::openmode which) {
    const std::uint64_t base = from == std::ios_base::beg   ? 0
                               : from == std::ios_base::cur ? blockEnd_ - static_cast<std::uint64_t>(egptr() - gptr())
                                                            : reader_.size();
    return seekpos(std::streambuf::pos_type(static_cast<std::streambuf::off_type>(base) + offset), which);
}

/// A position after the end can be reached, as in a file; nothing can be read there.
std::streambuf::pos_type ByteSourceStream::seekpos(std::streambuf::pos_type position, std::ios_base::openmode) {
    if (std::streambuf::off_type(position) < 0)
        return std::streambuf::pos_type(std::streambuf::off_type{-1});
    setg(nullptr, nullptr, nullptr);
    blockEnd_ = static_cast<std::uint64_t>(std::streambuf::off_type(position));
    return position;
}

} // namespace ZULMetaData
