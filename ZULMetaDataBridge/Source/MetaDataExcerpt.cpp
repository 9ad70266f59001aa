#include "ZULMetaDataBridge/Source/MetaDataExcerpt.h"

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/StreamExtent.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <span>
#include <vector>

namespace ZULMetaData {

namespace {

/// As far as the file holds them.
std::string bytesOf(const ReadBytes& read, std::uint64_t total, std::uint64_t begin, std::uint64_t end) {
    std::string bytes;
    bytes.resize(static_cast<std::size_t>(std::min(end, total) - std::min(begin, total)));
    bytes.resize(read(begin, bytes));
    return bytes;
}

/// What a RIFF file begins with, without any chunk in it.
std::string emptyRIFF(std::string start) {
    constexpr std::size_t sizeOffset = 4;
    constexpr std::uint32_t formSize = 4;
    if (start.size() == sizeOffset + sizeof formSize + formSize)
        std::memcpy(start.data() + sizeOffset, &formSize, sizeof formSize);
    return start;
}

} // namespace

std::string metaDataExcerpt(MetaDataParser& recording) {
    std::istream& stream = recording.getStream();
    const std::uint64_t total = sizeOfInput(stream);
    const ReadBytes read = readingFrom(stream);
    if (recording.getStreamType() == Container::RawStream)
        return bytesOf(read, total, 0, total);
    const std::vector<ContainerItem> items = listTopLevel(stream, recording.getStreamType());
    requireReadable(stream);
    std::string excerpt;
    for (const ContainerItem& item : items) {
        if (item.type == "RIFF" && item.offset == 0)
            excerpt += emptyRIFF(bytesOf(read, total, 0, item.headerSize + 4));
        if (item.type == "ftyp" || item.holdsRecordingInfo() || item.holdsMetaData())
            excerpt += bytesOf(read, total, item.offset, std::max(item.end(), item.offset));
        if (recording.getStreamType() == Container::Riff)
            excerpt.resize(excerpt.size() + excerpt.size() % 2);
    }
    return excerpt;
}

} // namespace ZULMetaData
