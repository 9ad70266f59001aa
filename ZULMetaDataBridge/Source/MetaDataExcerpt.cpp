#include "ZULMetaDataBridge/Source/MetaDataExcerpt.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <optional>

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

template <class... Integers>
std::string bigEndian(Integers... values) {
    const auto bytes = detail::bigEndianBytes(values...);
    return {bytes.data(), bytes.size()};
}

/// Returns an atom `moov` that says how long the movie is, in nanoseconds, and nothing about its tracks. Returns no
/// bytes if the movie does not tell its duration.
std::string movieHeader(const ByteSource& file) {
    constexpr std::uint32_t timescale = 1'000'000'000;
    constexpr double most = 9e9;                  // in seconds, so that 64 bits hold the duration
    constexpr std::uint32_t longTimes = 1U << 24; // the version, and no flags
    constexpr std::size_t otherFields = 80;       // rate, volume, matrix and the next track
    const std::optional<double> duration = movieDuration(file, Container::QuickTime);
    if (!duration || !(*duration >= 0 && *duration < most))
        return {};
    const auto time = static_cast<std::uint64_t>(std::llround(*duration * timescale));
    const std::string fields =
        bigEndian(longTimes, std::uint64_t{0}, std::uint64_t{0}, timescale, time) + std::string(otherFields, '\0');
    const auto atom = [](FourCC type, const std::string& contents) {
        const auto size = static_cast<std::uint32_t>(detail::s_atomHeaderSize + contents.size());
        const auto header = detail::atomHeader(type, size);
        return std::string(header.data(), header.size()) + contents;
    };
    return atom("moov", atom("mvhd", fields));
}

} // namespace

std::string metaDataExcerpt(MetaDataParser& recording) {
    const ByteSource file = ByteSource::stream(recording.getStream());
    const Container::Type type = recording.getStreamType();
    if (type == Container::RawStream)
        return detail::readAll(file);
    std::string start;
    std::string excerpt = type == Container::QuickTime ? movieHeader(file) : std::string();
    ItemWalk items(file, type);
    while (const auto item = items.next()) {
        if (type == Container::Riff && item->offset == 0)
            start = emptyRIFF(detail::readAll(file.part(0, item->headerSize + s_formSize)));
        else if (item->type == "ftyp")
            start += detail::readAll(file.part(item->offset, item->size));
        if (item->holdsRecordingInfo() || item->holdsMetaData())
            excerpt += detail::readAll(file.part(item->offset, item->size));
        if (type == Container::Riff)
            excerpt.resize(excerpt.size() + excerpt.size() % 2);
    }
    return start + excerpt;
}

} // namespace ZULMetaData
