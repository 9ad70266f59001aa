#pragma once

// Reads small pieces of a source through a window of it, so that a walk over headers or entries costs few reads.

#include "../SharedDependencies/EndianFile.h"
#include "../SharedDependencies/Export.h"
#include "ByteSource.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

/// Returns the number that is stored in `bytes` at `offset`. All of its bytes must exist.
template <class Number>
Number numberIn(std::string_view bytes, std::size_t offset) {
    Number number;
    std::memcpy(&number, bytes.data() + offset, sizeof number);
    return number;
}

/// Several walks may share one reader, because it has no position.
class ZULMETADATA_API ByteReader {
public:
    explicit ByteReader(ByteSource source) : source_(std::move(source)) {}

    const ByteSource& source() const { return source_; }
    std::uint64_t size() const { return source_.size(); }

    /// Returns `size` bytes at `position`, or fewer at the end. They are valid until the next call.
    std::string_view at(std::uint64_t position, std::uint64_t size) {
        if (position >= windowStart_ && position - windowStart_ <= window_.size() &&
            size <= window_.size() - (position - windowStart_)) [[likely]]
            return {window_.data() + (position - windowStart_), static_cast<std::size_t>(size)};
        return refilled(position, size);
    }

    /// Returns all bytes from `position` on that are in memory: at least one, except at the end.
    std::string_view from(std::uint64_t position) {
        const std::string_view first = at(position, 1);
        const auto size = window_.data() + window_.size() - first.data();
        return first.empty() ? first : std::string_view(first.data(), static_cast<std::size_t>(size));
    }

    /// Returns the number that is stored at `position` as this processor stores it. Empty if its bytes do not exist.
    template <class Number>
    std::optional<Number> numberAt(std::uint64_t position) {
        const std::string_view bytes = at(position, sizeof(Number));
        return bytes.size() < sizeof(Number) ? std::nullopt : std::optional(numberIn<Number>(bytes, 0));
    }

private:
    std::string_view refilled(std::uint64_t position, std::uint64_t size);

    ByteSource source_;
    std::vector<char> window_;
    std::uint64_t windowStart_ = 0;
    std::size_t blockSize_ = 0;
};

/// Reads one field after the other. A field is empty if its bytes do not lie before the end.
class ByteCursor {
public:
    ByteCursor(ByteReader& reader, std::uint64_t position, std::uint64_t end)
        : reader_(&reader), position_(position), end_(end) {}

    std::uint64_t position() const { return position_; }
    std::uint64_t left() const { return position_ < end_ ? end_ - position_ : 0; }
    bool enoughBytesLeft(std::uint64_t needed) const { return left() >= needed; }
    void skip(std::uint64_t bytes) { position_ = bytes > left() ? end_ : position_ + bytes; }

    template <class Number>
    bool read(Number& number) {
        const auto value = left() < sizeof number ? std::nullopt : reader_->numberAt<Number>(position_);
        if (!value)
            return false;
        number = *value;
        position_ += sizeof number;
        return true;
    }

    template <class Number>
    bool readBigEndian(Number& number) {
        const bool isRead = read(number);
        if (isRead)
            number = swapInt(number);
        return isRead;
    }

private:
    ByteReader* reader_;
    std::uint64_t position_;
    std::uint64_t end_;
};

} // namespace ZULMetaData::detail
