#include "ZULMetaData/MovieDuration.h"

#include "ZULMetaData/ContainerLayout.h"
#include "ZULMetaData/PositionedInput.h"

#include <algorithm>
#include <limits>

namespace ZULMetaData {

namespace {

/// Returns the first item of a type. `visitEach` calls a function for each item until that returns false.
template <class VisitEach>
std::optional<ContainerItem> firstOfType(std::string_view type, VisitEach visitEach) {
    std::optional<ContainerItem> found;
    visitEach([&](const ContainerItem& item) {
        if (item.type == type)
            found = item;
        return !found;
    });
    return found;
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
    const auto moov = firstOfType(
        "moov", [&](const ContainerVisitor& visit) { visitTopLevel(stream, MetaDataParser::QuickTime, visit); });
    if (!moov)
        return std::nullopt;
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    const auto header = firstOfType("mvhd", [&](const ContainerVisitor& visit) {
        visitAtoms(stream, moov->payloadOffset(), moov->end(), std::min(total, moov->end()), visit);
    });
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
