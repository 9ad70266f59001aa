#include "ZULMetaDataBridge/Source/MetaDataExcerpt.h"

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <cstdint>
#include <cstring>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_formSize = 4;

/// Returns what a RIFF file begins with, as a file without any chunk in it. Its size is in 32 bits, whatever it was.
std::string emptyRIFF(std::string start) {
    constexpr std::size_t sizeOffset = 4;
    constexpr std::uint32_t size = s_formSize;
    if (start.size() == sizeOffset + sizeof size + s_formSize)
        std::memcpy(start.replace(0, sizeOffset, "RIFF").data() + sizeOffset, &size, sizeof size);
    return start;
}

} // namespace

std::string metaDataExcerpt(MetaDataParser& recording) {
    const ByteSource file = ByteSource::stream(recording.getStream());
    const Container::Type type = recording.getStreamType();
    if (type == Container::RawStream)
        return detail::readAll(file);
    std::string excerpt;
    ItemWalk items(file, type);
    while (const auto item = items.next()) {
        if (type == Container::Riff && item->offset == 0)
            excerpt += emptyRIFF(detail::readAll(file.part(0, item->headerSize + s_formSize)));
        if (item->type == "ftyp" || item->holdsRecordingInfo() || item->holdsMetaData())
            excerpt += detail::readAll(file.part(item->offset, item->size));
        if (type == Container::Riff)
            excerpt.resize(excerpt.size() + excerpt.size() % 2);
    }
    return excerpt;
}

} // namespace ZULMetaData
