#pragma once

// What the machine does at best with the same bytes: blocks of 1 MiB through read(2) and write(2), and nothing else.

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <string>
#include <unistd.h>

namespace ZULMetaData::Bench {

inline constexpr std::size_t s_blockSize = 1 << 20;

/// Not checked for errors: its output is compared with the library's.
class RawWriter {
public:
    explicit RawWriter(const std::string& path)
        : file_(open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644)), block_(new char[s_blockSize]) {}
    RawWriter(const RawWriter&) = delete;
    RawWriter& operator=(const RawWriter&) = delete;
    ~RawWriter() {
        flush();
        close(file_);
    }

    template <class... Values>
    void append(const Values&... values) {
        if (used_ + (sizeof values + ...) > s_blockSize)
            flush();
        ((std::memcpy(block_.get() + used_, &values, sizeof values), used_ += sizeof values), ...);
    }

    void appendBytes(const char* bytes, std::size_t size) {
        if (used_ + size > s_blockSize)
            flush();
        std::memcpy(block_.get() + used_, bytes, size);
        used_ += size;
    }

    void flush() {
        if (write(file_, block_.get(), used_) == static_cast<ssize_t>(used_))
            used_ = 0;
    }

private:
    int file_;
    std::unique_ptr<char[]> block_;
    std::size_t used_ = 0;
};

/// Gives every block of a file behind its first `skipped` bytes to `take(const char*, std::size_t)`, which says how
/// many bytes it took; the rest comes again in front of the next block.
template <class Take>
void readBlocks(const std::string& path, std::size_t skipped, Take take) {
    const int file = open(path.c_str(), O_RDONLY);
    lseek(file, static_cast<off_t>(skipped), SEEK_SET);
    const std::unique_ptr<char[]> block(new char[s_blockSize]);
    std::size_t held = 0;
    for (ssize_t count; (count = read(file, block.get() + held, s_blockSize - held)) > 0;) {
        held += static_cast<std::size_t>(count);
        const std::size_t taken = take(static_cast<const char*>(block.get()), held);
        std::memmove(block.get(), block.get() + taken, held - taken);
        held -= taken;
    }
    close(file);
}

template <class T>
T valueAt(const char* bytes) {
    T value;
    std::memcpy(&value, bytes, sizeof value);
    return value;
}

} // namespace ZULMetaData::Bench
