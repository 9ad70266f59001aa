#include "ZULMetaData/ByteSource.h"

#include "SharedDependencies/EndianFile.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <memory>
#include <system_error>
#include <utility>

namespace ZULMetaData {

namespace {

std::uint64_t sizeOf(std::istream& input) {
    input.clear();
    input.seekg(0, std::ios_base::end);
    const std::int64_t size = toInt64(input.tellg());
    if (size < 0)
        input.setstate(std::ios_base::failbit);
    requireReadable(input);
    return static_cast<std::uint64_t>(size);
}

std::size_t readStream(std::istream& input, std::uint64_t position, std::span<char> bytes) {
    input.clear();
    input.seekg(static_cast<std::streamoff>(position));
    input.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    requireReadable(input);
    return static_cast<std::size_t>(input.gcount());
}

} // namespace

ByteSource::ByteSource(std::uint64_t size, Read read) : read_(std::move(read)), size_(size) {}

ByteSource ByteSource::file(const std::string& path) {
    const auto file = std::make_shared<std::ifstream>();
    file->rdbuf()->pubsetbuf(nullptr, 0); // whoever reads small pieces has a buffer of its own
    errno = 0;
    fileOpen(*file, path.c_str(), std::ios_base::binary);
    const std::error_code reason(errno, std::generic_category());
    if (!file->is_open())
        throw std::system_error(reason ? reason : std::make_error_code(std::errc::io_error), "cannot be opened");
    std::error_code error;
    if (!std::filesystem::is_regular_file(path, error))
        throw std::system_error(error ? error : std::make_error_code(std::errc::invalid_argument),
                                "is not a regular file");
    return {sizeOf(*file),
            [file](std::uint64_t position, std::span<char> bytes) { return readStream(*file, position, bytes); }};
}

ByteSource ByteSource::stream(std::istream& input) {
    return {sizeOf(input),
            [&input](std::uint64_t position, std::span<char> bytes) { return readStream(input, position, bytes); }};
}

ByteSource ByteSource::memory(std::string_view bytes) {
    return {bytes.size(), [bytes](std::uint64_t position, std::span<char> to) {
                return bytes.copy(to.data(), to.size(), static_cast<std::size_t>(position));
            }};
}

std::size_t ByteSource::read(std::uint64_t position, std::span<char> bytes) const {
    if (position >= size_ || bytes.empty())
        return 0;
    const std::uint64_t most = std::min<std::uint64_t>(bytes.size(), size_ - position);
    return read_(begin_ + position, bytes.first(static_cast<std::size_t>(most)));
}

ByteSource ByteSource::part(std::uint64_t offset, std::uint64_t size) const {
    ByteSource part = *this;
    const std::uint64_t begin = std::min(offset, size_);
    part.begin_ += begin;
    part.size_ = std::min(size, size_ - begin);
    return part;
}

void requireReadable(const std::istream& input) {
    if (input.bad() || (input.fail() && !input.eof()))
        throw std::system_error(EIO, std::generic_category(), "cannot be read");
}

} // namespace ZULMetaData
