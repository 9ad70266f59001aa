#include "ZULMetaData/StreamExtent.h"

#include <algorithm>
#include <cstring>
#include <vector>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_windowSize = 1 << 16;

/// Reads small pieces at rising positions out of large ones.
class Window {
public:
    explicit Window(const ReadBytes& read) : read_(read), bytes_(s_windowSize) {}

    template <class Record>
    bool readAt(std::uint64_t position, Record& record) {
        if (position < start_ || position + sizeof record > start_ + filled_) {
            start_ = position;
            filled_ = read_(position, bytes_);
        }
        if (filled_ < sizeof record)
            return false;
        std::memcpy(&record, bytes_.data() + (position - start_), sizeof record);
        return true;
    }

private:
    const ReadBytes& read_;
    std::vector<char> bytes_;
    std::uint64_t start_ = 0;
    std::size_t filled_ = 0;
};

void walkFixedEntries(std::uint64_t length, StreamExtent& extent) {
    extent.entries = (length - s_metaDataHeaderSize) / extent.header.fixedEntrySize;
    extent.wholeBytes = s_metaDataHeaderSize + extent.entries * extent.header.fixedEntrySize;
    extent.end = extent.wholeBytes == length ? StreamExtent::AtEntry : StreamExtent::InsideEntry;
}

void walkSizedEntries(Window& window, std::uint64_t length, StreamExtent& extent) {
    while (extent.wholeBytes < length) {
        std::uint32_t size = 0;
        const std::uint64_t left = length - extent.wholeBytes;
        extent.end = StreamExtent::InsideEntry;
        if (left < sizeof size || !window.readAt(extent.wholeBytes, size) || left - sizeof size < size)
            return;
        extent.end = size == 0 ? StreamExtent::EmptyEntry : StreamExtent::AtEntry;
        if (size == 0)
            return;
        extent.wholeBytes += sizeof size + size;
        ++extent.entries;
    }
}

} // namespace

std::optional<StreamExtent> measureStream(const ReadBytes& read, std::uint64_t length) {
    Window window(read);
    StreamExtent extent;
    if (length < s_metaDataHeaderSize || !window.readAt(0, extent.header))
        return std::nullopt;
    extent.wholeBytes = s_metaDataHeaderSize;
    if (extent.header.fixedEntrySize == 0)
        walkSizedEntries(window, length, extent);
    else
        walkFixedEntries(length, extent);
    return extent;
}

std::optional<StreamExtent> measureStream(std::istream& input, std::uint64_t offset, std::uint64_t length) {
    const ReadBytes read = readingFrom(input);
    return measureStream([&](std::uint64_t position, std::span<char> bytes) { return read(offset + position, bytes); },
                         length);
}

ReadBytes readingFrom(std::istream& input) {
    return [&input](std::uint64_t position, std::span<char> bytes) {
        input.clear();
        input.seekg(static_cast<std::streamoff>(position));
        input.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        return static_cast<std::size_t>(input.gcount());
    };
}

} // namespace ZULMetaData
