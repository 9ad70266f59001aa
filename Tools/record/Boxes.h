#pragma once

// The atoms of a movie's index, taken apart and put together in memory.

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

namespace Recorder {

using Bytes = std::vector<std::uint8_t>;

/// Numbers of one atom, one after the other. Reading beyond the end returns 0 and makes `isWhole` false.
class BoxReader {
public:
    explicit BoxReader(std::span<const std::uint8_t> bytes) : bytes_(bytes) {}

    std::uint32_t u32() { return static_cast<std::uint32_t>(number(4)); }
    std::uint64_t u64() { return number(8); }
    std::int32_t i32() { return static_cast<std::int32_t>(u32()); }
    std::uint8_t u8() { return static_cast<std::uint8_t>(number(1)); }
    void skip(std::size_t count) {
        isWhole_ = isWhole_ && left() >= count;
        position_ += std::min(count, left());
    }

    bool isWhole() const { return isWhole_; }
    std::size_t left() const { return bytes_.size() - position_; }

private:
    std::uint64_t number(std::size_t size) {
        if (left() < size) {
            isWhole_ = false;
            return 0;
        }
        std::uint64_t value = 0;
        for (std::size_t i = 0; i < size; ++i)
            value = value << 8 | bytes_[position_ + i];
        position_ += size;
        return value;
    }

    std::span<const std::uint8_t> bytes_;
    std::size_t position_ = 0;
    bool isWhole_ = true;
};

/// One atom inside of another.
struct Box {
    std::uint32_t type = 0;
    std::span<const std::uint8_t> whole;   ///< with its header
    std::span<const std::uint8_t> payload; ///< without
};

/// The number of a type, such as "moov".
constexpr std::uint32_t boxType(std::string_view name) {
    std::uint32_t type = 0;
    for (const char letter : name)
        type = type << 8 | static_cast<std::uint8_t>(letter);
    return type;
}

/// Returns the atoms in these bytes, up to the first that does not fit.
std::vector<Box> boxesIn(std::span<const std::uint8_t> bytes);

/// Returns the first atom of this type, or one without bytes.
Box childOf(const Box& parent, std::uint32_t type);

/// Puts atoms together.
class BoxWriter {
public:
    void u8(std::uint8_t value) { bytes_.push_back(value); }
    void u16(std::uint16_t value) { number(value, 2); }
    void u32(std::uint32_t value) { number(value, 4); }
    void u64(std::uint64_t value) { number(value, 8); }
    void bytes(std::span<const std::uint8_t> values) { bytes_.insert(bytes_.end(), values.begin(), values.end()); }

    /// Writes an atom whose payload `content` writes.
    template <class Content>
    void box(std::uint32_t type, Content content) {
        const std::size_t start = bytes_.size();
        u32(0);
        u32(type);
        content();
        setU32(start, static_cast<std::uint32_t>(bytes_.size() - start));
    }

    /// The same for an atom that begins with a version and flags.
    template <class Content>
    void fullBox(std::uint32_t type, std::uint8_t version, std::uint32_t flags, Content content) {
        box(type, [&] {
            u32(std::uint32_t{version} << 24 | flags);
            content();
        });
    }

    const Bytes& result() const { return bytes_; }

private:
    void number(std::uint64_t value, std::size_t size) {
        for (std::size_t i = 1; i <= size; ++i)
            bytes_.push_back(static_cast<std::uint8_t>(value >> (8 * (size - i))));
    }
    void setU32(std::size_t position, std::uint32_t value) {
        for (std::size_t i = 0; i < 4; ++i)
            bytes_[position + i] = static_cast<std::uint8_t>(value >> (24 - 8 * i));
    }

    Bytes bytes_;
};

} // namespace Recorder
