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
constexpr double s_cursor = 48;      ///< units of the display that a cursor reaches from its hot spot
constexpr double s_titleBar = 48;    ///< units of the display around the upper edge of a window

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

    /// Returns the times in which the value of a track lies in one of the places. What is not known
    /// counts if `countsUnknown`. If the values are places of something that `moves`, the time between two values
    /// counts if one of them lies there.
    template <class Kind>
    std::vector<TimeRange> of(const Track<Kind>& track,
                              bool (*lies)(const ScreenRect&, const typename Track<Kind>::Value&), bool countsUnknown,
                              bool moves = false) const {
        std::vector<TimeRange> ranges;
        for (const CoveredPlace& place : places_) {
            const auto add = [&](double from, double to) {
                if (from <= to)
                    ranges.push_back({from, to});
            };
            const auto times = track.times();
            if (countsUnknown)
                add(place.from, track.empty() ? place.to : std::min(place.to, times.front()));
            for (std::size_t i = 0; i < track.size(); ++i) {
                const double end = i + 1 < track.size() ? times[i + 1] : place.to;
                const bool isThere = lies(place.area, track.values()[i]);
                const bool goesThere = moves && i + 1 < track.size() && lies(place.area, track.values()[i + 1]);
                if (isThere || goesThere)
                    add(std::max(place.from, times[i]), std::min(place.to, end));
            }
        }
        return ranges;
    }

    std::vector<TimeRange> always() const {
        std::vector<TimeRange> ranges;
        for (const CoveredPlace& place : places_)
            ranges.push_back({place.from, place.to});
        return ranges;
    }

private:
    const std::vector<CoveredPlace>& places_;
};

/// Which times are removed from the stream of a kind.
class Removal {
public:
    Removal(const Recording& recording, const std::vector<CoveredPlace>& places) : always_(Presence(places).always()) {
        const Presence presence(places);
        cursor_ = presence.of<CursorLocationKind>(recording.track<CursorLocationKind>(), touchesPoint, true, true);
        const auto& windows = recording.track<TopmostWindowKind>();
        window_ = presence.of<TopmostWindowKind>(windows, touchesRect, true);
        title_ = presence.of<TopmostWindowKind>(windows, touchesTitle, true);
        hover_ = presence.of<HoverRectKind>(recording.track<HoverRectKind>(), touchesRect, false);
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

} // namespace

Redactions Redactions::read(std::string_view document, const std::string& file) {
    constexpr double most = 1e7;
    JsonFields fields(document, file, "zulm.redactions");
    Redactions redactions;
    const std::size_t count = fields.array("places");
    for (std::size_t i = 0; i < count; ++i) {
        const std::string path = fmt::format("places[{}]", i);
        fields.section(path);
        for (const char* member : {".from", ".to", ".x", ".y", ".width", ".height"})
            if (!fields.has(path + member))
                fields.failAt(path, fmt::format("has no \"{}\"", member + 1));
        CoveredPlace place;
        fields.number(path + ".from", 0, most, place.from);
        fields.number(path + ".to", 0, most, place.to);
        fields.number(path + ".x", -most, most, place.area.x);
        fields.number(path + ".y", -most, most, place.area.y);
        fields.number(path + ".width", 0, most, place.area.width);
        fields.number(path + ".height", 0, most, place.area.height);
        if (place.to <= place.from || place.area.width <= 0 || place.area.height <= 0)
            fields.failAt(path, "must have an area, and end after it begins");
        redactions.places_.push_back(place);
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
