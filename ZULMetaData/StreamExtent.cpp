#include "ZULMetaData/StreamExtent.h"

#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <cerrno>
#include <system_error>

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

/// A stream in memory refuses to seek past its end, which is no failure. If a file refuses a seek, it has failed.
bool isBehindEnd(std::istream& input, std::uint64_t position) {
    input.clear();
    const std::int64_t size = ParserUtil::calcFileSize(input);
    const bool isBehind = !input.fail() && size >= 0 && static_cast<std::uint64_t>(size) < position;
    input.setstate(std::ios_base::failbit);
    return isBehind;
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
    return [&input](std::uint64_t position, std::span<char> bytes) -> std::size_t {
        input.clear();
        input.seekg(static_cast<std::streamoff>(position));
        if (input.fail() && isBehindEnd(input, position))
            return 0;
        input.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        requireReadable(input);
        return static_cast<std::size_t>(input.gcount());
    };
}

void requireReadable(const std::istream& input) {
    if (input.bad() || (input.fail() && !input.eof()))
        throw std::system_error(EIO, std::generic_category(), "cannot be read");
}

std::uint64_t sizeOfInput(std::istream& input) {
    input.clear();
    const std::int64_t size = ParserUtil::calcFileSize(input);
    if (size < 0)
        input.setstate(std::ios_base::failbit);
    requireReadable(input);
    return static_cast<std::uint64_t>(size);
}

} // namespace ZULMetaData
