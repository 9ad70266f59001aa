#pragma once

// A stream that tells what was read of it, and can refuse to go somewhere.

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <istream>
#include <optional>
#include <streambuf>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

/// Nothing is buffered: what is read is what was asked for.
class WatchedBuffer : public std::streambuf {
public:
    explicit WatchedBuffer(std::string bytes) : bytes_(std::move(bytes)) {}

    /// Of reads and seeks; asking for the position is none.
    std::size_t steps() const { return steps_; }
    std::size_t bytesRead() const { return bytesRead_; }
    /// One past the last byte in front of `limit` that was ever read.
    std::size_t lastReadBefore(std::size_t limit) const {
        std::size_t last = 0;
        for (const std::size_t position : readPositions_)
            last = position < limit ? std::max(last, position + 1) : last;
        return last;
    }
    /// Where it was sent to, in order.
    const std::vector<std::size_t>& seeks() const { return seeks_; }

    void refuse(std::size_t position) { refused_ = position; }

protected:
    std::streamsize xsgetn(char* to, std::streamsize count) override {
        ++steps_;
        const std::size_t size = std::min(static_cast<std::size_t>(count), bytes_.size() - position_);
        std::memcpy(to, bytes_.data() + position_, size);
        note(size);
        position_ += size;
        return static_cast<std::streamsize>(size);
    }

    int_type underflow() override {
        return position_ < bytes_.size() ? traits_type::to_int_type(bytes_[position_]) : traits_type::eof();
    }

    int_type uflow() override {
        const int_type next = underflow();
        if (next != traits_type::eof()) {
            note(1);
            ++position_;
        }
        return next;
    }

    pos_type seekoff(off_type offset, std::ios_base::seekdir direction, std::ios_base::openmode mode) override {
        if (direction == std::ios_base::cur && offset == 0)
            return static_cast<off_type>(position_);
        const off_type base = direction == std::ios_base::beg   ? 0
                              : direction == std::ios_base::cur ? static_cast<off_type>(position_)
                                                                : static_cast<off_type>(bytes_.size());
        return seekpos(base + offset, mode);
    }

    pos_type seekpos(pos_type target, std::ios_base::openmode) override {
        ++steps_;
        const off_type offset = target;
        if (offset < 0 || offset > static_cast<off_type>(bytes_.size()) || static_cast<std::size_t>(offset) == refused_)
            return off_type(-1);
        position_ = static_cast<std::size_t>(offset);
        seeks_.push_back(position_);
        return target;
    }

private:
    void note(std::size_t size) {
        bytesRead_ += size;
        for (std::size_t i = 0; i < size; ++i)
            readPositions_.push_back(position_ + i);
    }

    std::string bytes_;
    std::size_t position_ = 0;
    std::size_t steps_ = 0;
    std::size_t bytesRead_ = 0;
    std::vector<std::size_t> readPositions_;
    std::vector<std::size_t> seeks_;
    std::optional<std::size_t> refused_;
};

class WatchedStream : private WatchedBuffer, public std::istream {
public:
    explicit WatchedStream(std::string bytes)
        : WatchedBuffer(std::move(bytes)), std::istream(static_cast<WatchedBuffer*>(this)) {}

    WatchedBuffer& buffer() { return *this; }
};

} // namespace ZULMetaData::Test
