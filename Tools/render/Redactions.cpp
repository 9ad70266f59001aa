#include "Tools/render/Redactions.h"

#include "Tools/render/JsonFields.h"
#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <functional>
#include <sstream>

namespace Render {

using namespace ZULMetaData;

namespace {

constexpr double s_rounding = 0.001; ///< seconds: movies round their times by less
constexpr std::size_t s_mostPlaces = 1000;
constexpr double s_cursor = 48;   ///< units of the display that a cursor reaches from its hot spot
constexpr double s_titleBar = 48; ///< units of the display around the upper edge of a window

ScreenRect screenRect(const Rect& rect) {
    return {static_cast<double>(rect.x), static_cast<double>(rect.y), static_cast<double>(rect.width),
            static_cast<double>(rect.height)};
}

bool touches(const ScreenRect& left, const ScreenRect& right) {
    return left.x <= right.x + right.width && right.x <= left.x + left.width && left.y <= right.y + right.height &&
           right.y <= left.y + left.height;
}

bool touchesPoint(const ScreenRect& area, const Point& point) {
    return touches(area, {static_cast<double>(point.x), static_cast<double>(point.y), 0, 0});
}

bool touchesRect(const ScreenRect& area, const Rect& rect) {
    return touches(area, screenRect(rect));
}

/// Returns a track, or an empty one if its stream cannot be decoded. Such a stream is left out of the result.
template <class Kind>
const Track<Kind>& trackOf(const Recording& recording) {
    static const Track<Kind> unknown;
    try {
        return recording.track<Kind>();
    } catch (const Error&) {
        return unknown;
    }
}

/// Returns the same times as ranges that do not touch one another, in their order.
std::vector<TimeRange> united(std::vector<TimeRange> ranges) {
    std::sort(ranges.begin(), ranges.end(),
              [](const TimeRange& left, const TimeRange& right) { return left.from < right.from; });
    std::vector<TimeRange> result;
    for (const TimeRange& range : ranges)
        if (!result.empty() && range.from <= result.back().to)
            result.back().to = std::max(result.back().to, range.to);
        else
            result.push_back(range);
    return result;
}

bool touchesTitle(const ScreenRect& area, const Rect& window) {
    ScreenRect bar = screenRect(window);
    bar.y -= s_titleBar;
    bar.height = 2 * s_titleBar;
    return touches(area, bar);
}

/// When something is in a place.
class Presence {
public:
    explicit Presence(const std::vector<CoveredPlace>& places) : places_(places) {}

    /// Returns the times in which the value of a track lies in one of the places. What is not known counts if
    /// `countsUnknown`. If the values are places of something that `moves`, the time between two values counts if one
    /// of them lies there.
    template <class Kind>
    std::vector<TimeRange> of(const Track<Kind>& track,
                              bool (*lies)(const ScreenRect&, const typename Track<Kind>::Value&), bool countsUnknown,
                              bool moves = false) const {
        std::vector<TimeRange> ranges;
        for (const CoveredPlace& place : places_) {
            const std::size_t before = ranges.size();
            const auto add = [&](double from, double to) {
                if (ranges.size() > before && from <= ranges.back().to)
                    ranges.back().to = std::max(ranges.back().to, to);
                else if (from <= to)
                    ranges.push_back({from, to});
            };
            const auto times = track.times();
            if (countsUnknown && (track.empty() || place.from < times.front()))
                add(place.from, track.empty() ? place.to : std::min(place.to, times.front()));
            const std::size_t holding = track.countUntil(place.from); // entries at one time may be the last of it
            const std::size_t first = holding > 0 ? track.countUntil(std::nextafter(times[holding - 1], -HUGE_VAL)) : 0;
            for (std::size_t i = first; i < track.size() && times[i] <= place.to; ++i) {
                const double end = i + 1 < track.size() ? times[i + 1] : place.to;
                const bool isThere = lies(place.area, track.values()[i]);
                const bool goesThere = moves && i + 1 < track.size() && lies(place.area, track.values()[i + 1]);
                if (isThere || goesThere)
                    add(std::max(place.from, times[i]), std::min(place.to, end));
            }
        }
        return united(std::move(ranges));
    }

    std::vector<TimeRange> always() const {
        std::vector<TimeRange> ranges;
        for (const CoveredPlace& place : places_)
            ranges.push_back({place.from, place.to});
        return united(std::move(ranges));
    }

private:
    const std::vector<CoveredPlace>& places_;
};

/// Which times are removed from the stream of a kind.
class Removal {
public:
    Removal(const Recording& recording, const std::vector<CoveredPlace>& places) : always_(Presence(places).always()) {
        const Presence presence(places);
        cursor_ = presence.of<CursorLocationKind>(trackOf<CursorLocationKind>(recording), touchesPoint, true, true);
        const auto& windows = trackOf<TopmostWindowKind>(recording);
        window_ = presence.of<TopmostWindowKind>(windows, touchesRect, true);
        title_ = presence.of<TopmostWindowKind>(windows, touchesTitle, true);
        hover_ = presence.of<HoverRectKind>(trackOf<HoverRectKind>(recording), touchesRect, false);
    }

    std::vector<TimeRange> timesOf(const uuid& kind) const {
        const auto isOneOf = [&kind](std::initializer_list<uuid> kinds) {
            return std::find(kinds.begin(), kinds.end(), kind) != kinds.end();
        };
        if (isOneOf({CursorLocationKind::type, CursorActionKind::type, ScrollActionKind::type, CursorImageKind::type}))
            return cursor_;
        if (isOneOf({KeyboardActionKind::type}))
            return window_;
        if (isOneOf({TopmostWindowTitleKind::type, TopmostAppNameKind::type}))
            return title_;
        if (isOneOf({HoverRectKind::type}))
            return hover_;
        if (isOneOf({CursorOpacityKind::type, CPUUsageKind::type, TopmostWindowKind::type, RecordingRegionKind::type,
                     ScaleFactorKind::type, SystemDataKind::type}))
            return {};
        return always_; // texts of slides, and what nobody knows
    }

private:
    std::vector<TimeRange> always_;
    std::vector<TimeRange> cursor_;
    std::vector<TimeRange> window_;
    std::vector<TimeRange> title_;
    std::vector<TimeRange> hover_;
};

constexpr std::array s_sides{".x", ".y", ".width", ".height"};

CoveredPlace readPlace(JsonFields& fields, const std::string& path) {
    constexpr double most = 1e7;
    fields.section(path);
    const auto isGiven = [&](const char* member) { return fields.has(path + member); };
    const auto require = [&](const char* member) {
        if (!isGiven(member))
            fields.failAt(path, fmt::format("has no \"{}\"", member + 1));
    };
    require(".from");
    require(".to");
    CoveredPlace place;
    place.area = {-2 * most, -2 * most, 4 * most, 4 * most}; // all of the picture
    fields.number(path + ".from", 0, most, place.from);
    fields.number(path + ".to", 0, most, place.to);
    if (std::any_of(s_sides.begin(), s_sides.end(), isGiven)) {
        std::for_each(s_sides.begin(), s_sides.end(), require);
        fields.number(path + ".x", -most, most, place.area.x);
        fields.number(path + ".y", -most, most, place.area.y);
        fields.number(path + ".width", 0, most, place.area.width);
        fields.number(path + ".height", 0, most, place.area.height);
    }
    if (place.to <= place.from || place.area.width <= 0 || place.area.height <= 0)
        fields.failAt(path, "must have an area, and end after it begins");
    return place;
}

} // namespace

Redactions Redactions::read(std::string_view document, const std::string& file) {
    JsonFields fields(document, file, "zulm.redactions");
    Redactions redactions;
    const std::size_t count = fields.array("places");
    if (count > s_mostPlaces)
        fields.failAt("places", fmt::format("has {} places; at most {} are covered", count, s_mostPlaces));
    for (std::size_t i = 0; i < count; ++i) {
        redactions.places_.push_back(readPlace(fields, fmt::format("places[{}]", i)));
    }
    fields.requireNothingLeft();
    return redactions;
}

bool Redactions::cover(YuvPicture& picture, double time, const ScreenRect& region) const {
    bool isCovered = false;
    const double scaleX = picture.width() / region.width;
    const double scaleY = picture.height() / region.height;
    const auto pixel = [](double value, int most) {
        return static_cast<int>(std::clamp(value, 0.0, static_cast<double>(most)));
    };
    for (const CoveredPlace& place : places_) {
        if (time < place.from - s_rounding || time > place.to + s_rounding)
            continue;
        if (!isCovered)
            picture = picture.copy();
        isCovered = true;
        const ScreenRect& area = place.area;
        const int left = pixel(std::floor((area.x - region.x) * scaleX), picture.width());
        const int top = pixel(std::floor((area.y - region.y) * scaleY), picture.height());
        const int right = pixel(std::ceil((area.x + area.width - region.x) * scaleX), picture.width());
        const int bottom = pixel(std::ceil((area.y + area.height - region.y) * scaleY), picture.height());
        picture.fill({left, top, right - left, bottom - top}, {0, 0, 0, 1});
    }
    return isCovered;
}

bool Redactions::hidesCursor(const ScreenPoint& position, double time) const {
    return std::any_of(places_.begin(), places_.end(), [&](const CoveredPlace& place) {
        return time >= place.from - s_rounding && time <= place.to + s_rounding &&
               touches(place.area, {position.x - s_cursor, position.y - s_cursor, 2 * s_cursor, 2 * s_cursor});
    });
}

RedactedStreams Redactions::redacted(const Recording& recording) const {
    const Removal removal(recording, places_);
    RedactedTexts texts;
    std::vector<Redaction> redactions;
    for (const StreamInfo& stream : recording.streams()) {
        Redaction& redaction = redactions.emplace_back();
        redaction.removedTimes = removal.timesOf(stream.type);
        collectRedactedTexts(recording.bytesOf(stream), redaction, texts);
    }
    RedactedStreams result;
    for (std::size_t i = 0; i < redactions.size(); ++i) {
        const StreamInfo& stream = recording.streams()[i];
        redactions[i].hidesText = [&texts](const std::string& text) { return texts.hidden.contains(text); };
        std::ostringstream bytes;
        const RedactedStream redacted = redactStream(recording.bytesOf(stream), redactions[i], bytes);
        if (redacted.removal == RedactedStream::Kept)
            result.streams.push_back(bytes.str());
        else
            result.losses.push_back(fmt::format("its stream {} cannot be decoded, so that nobody can tell what in it "
                                                "is covered; it was left out",
                                                stream.name()));
        if (redacted.bytesLeftOut > 0)
            result.losses.push_back(fmt::format("its stream {} lost {} bytes after its last whole entry", stream.name(),
                                                redacted.bytesLeftOut));
    }
    return result;
}

} // namespace Render
