#include "ZULMetaData/StreamExtent.h"

#include "ZULMetaData/StreamEntries.h"

namespace ZULMetaData {

namespace {

void walkFixedEntries(std::uint64_t length, StreamExtent& extent) {
    extent.entries = (length - s_metaDataHeaderSize) / extent.header.fixedEntrySize;
    extent.wholeBytes = s_metaDataHeaderSize + extent.entries * extent.header.fixedEntrySize;
    extent.end = extent.wholeBytes == length ? StreamExtent::AtEntry : StreamExtent::InsideEntry;
}

void walkSizedEntries(StreamEntries& entries, StreamExtent& extent) {
    while (entries.next())
        ++extent.entries;
    extent.wholeBytes = entries.wholeBytes();
    extent.end = entries.end();
}

} // namespace

std::optional<StreamExtent> measureStream(const ReadBytes& read, std::uint64_t length) {
    StreamEntries entries(read, length);
    if (!entries.header())
        return std::nullopt;
    StreamExtent extent;
    extent.header = *entries.header();
    if (extent.header.fixedEntrySize == 0)
        walkSizedEntries(entries, extent);
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
