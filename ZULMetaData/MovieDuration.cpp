#include "ZULMetaData/MovieDuration.h"

#include "ZULMetaData/ContainerLayout.h"
#include "ZULMetaData/PositionedInput.h"

#include <algorithm>
#include <limits>

namespace ZULMetaData {

namespace {

const ContainerItem* findType(const std::vector<ContainerItem>& items, std::string_view type) {
    const auto found =
        std::find_if(items.begin(), items.end(), [&](const ContainerItem& item) { return item.type == type; });
    return found == items.end() ? nullptr : &*found;
}

/// [version: 1][flags: 3][created][changed][timescale: 4][duration], where version 1 has 64 bits for the two times and
/// the duration, and every other 32. A duration of all ones is open.
template <class Integer>
std::optional<double> durationAt(detail::PositionedInput& input) {
    Integer ignored = 0;
    std::uint32_t timescale = 0;
    Integer duration = 0;
    if (!input.readBigEndian(ignored) || !input.readBigEndian(ignored) || !input.readBigEndian(timescale) ||
        !input.readBigEndian(duration))
        return std::nullopt;
    if (timescale == 0 || duration == std::numeric_limits<Integer>::max())
        return std::nullopt;
    return static_cast<double>(duration) / timescale;
}

} // namespace

std::optional<double> movieDuration(MetaDataParser& movie) {
    if (movie.getStreamType() != MetaDataParser::QuickTime)
        return std::nullopt;
    std::istream& stream = movie.getStream();
    const auto topLevel = listTopLevel(stream, MetaDataParser::QuickTime);
    const ContainerItem* moov = findType(topLevel, "moov");
    if (!moov)
        return std::nullopt;
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    const auto children = listAtoms(stream, moov->payloadOffset(), moov->end(), std::min(total, moov->end()));
    const ContainerItem* header = findType(children, "mvhd");
    if (!header)
        return std::nullopt;
    stream.clear();
    stream.seekg(0);
    detail::PositionedInput input(stream, 0, std::min(total, header->end()));
    std::uint32_t versionAndFlags = 0;
    if (!input.moveTo(header->payloadOffset()) || !input.readBigEndian(versionAndFlags))
        return std::nullopt;
    return versionAndFlags >> 24 == 1 ? durationAt<std::uint64_t>(input) : durationAt<std::uint32_t>(input);
}

} // namespace ZULMetaData
