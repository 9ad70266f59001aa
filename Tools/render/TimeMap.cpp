#include "Tools/render/TimeMap.h"

#include <algorithm>
#include <cmath>

namespace Render {

namespace {

/// Times of frames are rounded by less, in seconds.
constexpr double s_rounding = 1e-7;

} // namespace

TimeMap::TimeMap(const ZULMetaData::EditList& edits) : duration_(edits.duration().nearest()) {
    for (std::size_t i = 0; i < edits.pieces().size(); ++i) {
        const ZULMetaData::EditPiece& piece = edits.pieces()[i];
        pieces_.push_back({edits.bases()[i].nearest(), piece.start.nearest(), piece.end.nearest(),
                           piece.speed.nearest(), piece.isHeld()});
    }
}

std::int64_t TimeMap::frames(double fps) const {
    return std::max<std::int64_t>(1, std::llround(std::ceil(duration_ * fps - 1e-4)));
}

FilmTime TimeMap::at(double film) const {
    const auto after = std::upper_bound(pieces_.begin(), pieces_.end(), film + s_rounding,
                                        [](double time, const Piece& piece) { return time < piece.base; });
    const auto place = after == pieces_.begin() ? after : after - 1;
    const Piece& piece = *place;
    const double source = piece.isHeld ? piece.start
                                       : std::clamp(piece.start + (film - piece.base) * piece.speed, piece.start,
                                                    std::max(piece.start, piece.end - s_rounding));
    return {film, source, static_cast<std::size_t>(place - pieces_.begin())};
}

std::optional<double> TimeMap::since(double source, const FilmTime& now) const {
    const Piece& piece = pieces_[now.piece];
    if (source > now.source || (!piece.isHeld && source < piece.start))
        return std::nullopt;
    return (now.source - source) / (piece.isHeld ? 1 : piece.speed);
}

} // namespace Render
