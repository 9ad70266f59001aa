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

[[noreturn]] void throwReason(int code, const char* sentence) {
    throw std::system_error(code == 0 ? EIO : code, std::generic_category(), sentence);
}

/// A file that is only read. It has no buffer, because whoever reads small pieces has one of their own, and no stream,
/// whose locale would take longer to set up than a small file to read.
class UnbufferedFile {
public:
    explicit UnbufferedFile(const std::string& path) {
        std::error_code unknown;
        const std::filesystem::file_status found = std::filesystem::status(path, unknown);
        open(path, std::filesystem::is_fifo(found));
        if (!std::filesystem::is_regular_file(found))
            throwReason(unknown ? unknown.value() : EINVAL, "is not a regular file");
    }

    std::uint64_t size() {
        const std::int64_t size = toInt64(buffer_.pubseekoff(0, std::ios_base::end, std::ios_base::in));
        if (size < 0)
            throwReason(EIO, "cannot be read");
        return static_cast<std::uint64_t>(size);
    }

    std::size_t read(std::uint64_t position, std::span<char> bytes) {
        try {
            const auto target = static_cast<std::streamoff>(position);
            if (std::streamoff(buffer_.pubseekpos(target, std::ios_base::in)) == target)
                return static_cast<std::size_t>(
                    buffer_.sgetn(bytes.data(), static_cast<std::streamsize>(bytes.size())));
        } catch (const std::ios_base::failure&) { // the reading failed
        }
        throwReason(EIO, "cannot be read");
    }

private:
    /// Does what `fileOpen` does with a stream: it does not open a pipe, and opens again after a signal.
    void open(const std::string& path, bool isPipe) {
        if (isPipe)
            throwReason(EINVAL, "cannot be opened");
        buffer_.pubsetbuf(nullptr, 0);
        bool isOpen = false;
        do {
            errno = 0;
            isOpen = buffer_.open(path, std::ios_base::in | std::ios_base::binary) != nullptr;
        } while (!isOpen && errno == EINTR);
        if (!isOpen)
            throwReason(errno, "cannot be opened");
    }

    std::filebuf buffer_;
};

} // namespace

ByteSource::ByteSource(std::uint64_t size, Read read) : read_(std::move(read)), size_(size) {}

ByteSource ByteSource::file(const std::string& path) {
    const auto file = std::make_shared<UnbufferedFile>(path);
    return {file->size(),
            [file](std::uint64_t position, std::span<char> bytes) { return file->read(position, bytes); }};
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
