#include "Tools/render/FilmSession.h"

#include "Tools/render/JsonFields.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <filesystem>

namespace Render {

using namespace ZULMetaData;

namespace {

constexpr double s_fade = 0.25; ///< seconds in which a cursor at rest disappears

/// Returns a track of the edited streams. One that cannot be read is empty.
template <class Kind>
Track<Kind> trackIn(const EditedRecording& edited, const Callback<void(const Error&)>& leaveOut) {
    for (const EditedStream& stream : edited.streams)
        if (stream.source.type == Kind::type) {
            try {
                return Recording(stream.bytes, "edited.dat").track<Kind>();
            } catch (const Error& error) {
                leaveOut(error);
            }
        }
    return {};
}

std::vector<double> movesIn(const Track<CursorLocationKind>& positions, const std::vector<Click>& clicks) {
    std::vector<double> times;
    for (std::size_t i = 0; i < positions.size(); ++i) {
        const Point& now = positions.values()[i];
        if (i == 0 || now.x != positions.values()[i - 1].x || now.y != positions.values()[i - 1].y)
            times.push_back(positions.times()[i]);
    }
    for (const Click& click : clicks)
        times.insert(times.end(), {click.start, click.end});
    std::sort(times.begin(), times.end());
    return times;
}

InsightOptions optionsOf(const Style& style) {
    InsightOptions options;
    options.captions.showsKeys = style.keys.display == KeyDisplay::Shown;
    options.captions.showsShortcuts = true;
    options.zooms.factor = style.zoom.factor;
    options.camera.settleTime = style.zoom.settleTime;
    options.camera.followsCursor = style.zoom.followsCursor;
    return options;
}

} // namespace

FilmSession::FilmSession(const Recording& recording, const EditList& edits, const Style& style,
                         const PictureSize& movie, const Callback<void(const Error&)>& leaveOut)
    : style_(style), times_(edits), timeline_(recording, leaveOut),
      streams_(recording, edits, std::filesystem::temp_directory_path().string()) {
    const auto leaveOutQuietly = [](const Error&) {}; // the timeline has told already
    InsightSources sources = insightSourcesOf(recording, leaveOutQuietly);
    region_ = timeline_.at(0).toPicture(movie).region();
    sources.screen = region_;
    clicks_ = clicksOf(sources.actions, sources.positions, sources.duration);
    positions_ = sources.positions;
    path_ = CursorPath(positions_, clicks_);
    moves_ = movesIn(sources.positions, clicks_);

    const EditedRecording& edited = streams_.edited();
    sources.positions = trackIn<CursorLocationKind>(edited, leaveOutQuietly);
    sources.actions = trackIn<CursorActionKind>(edited, leaveOutQuietly);
    sources.keys = trackIn<KeyboardActionKind>(edited, leaveOutQuietly);
    sources.scrolling = trackIn<ScrollActionKind>(edited, leaveOutQuietly);
    sources.windows = trackIn<TopmostWindowKind>(edited, leaveOutQuietly);
    sources.titles = trackIn<TopmostWindowTitleKind>(edited, leaveOutQuietly);
    sources.applications = trackIn<TopmostAppNameKind>(edited, leaveOutQuietly);
    sources.slides = trackIn<SlideInfoTitleKind>(edited, leaveOutQuietly);
    sources.duration = times_.duration();
    filmInsights_ = insightsOf(sources, optionsOf(style));
    if (!style.zoom.isAutomatic)
        setZooms({});
}

void FilmSession::setZooms(const std::vector<Zoom>& zooms) {
    CameraOptions options = optionsOf(style_).camera;
    options.followsCursor = false;
    filmInsights_.zooms = zooms;
    filmInsights_.camera = Camera(zooms, filmInsights_.path, region_, options);
}

std::optional<ScreenPoint> FilmSession::positionAt(double time) const {
    constexpr double rounding = 1e-6; // seconds; times of the film are sums of rounded numbers
    const Point* recorded = positions_.at(time + rounding);
    if (!recorded)
        return std::nullopt;
    return style_.cursor.isSmooth ? path_.at(time) : ScreenPoint(*recorded);
}

double FilmSession::visibilityAt(double time) const {
    if (!style_.cursor.hideAfter)
        return 1;
    const auto after = std::upper_bound(moves_.begin(), moves_.end(), time);
    const double last = after == moves_.begin() ? 0 : *(after - 1);
    return std::clamp(1 - (time - last - *style_.cursor.hideAfter) / s_fade, 0.0, 1.0);
}

std::optional<CursorState> FilmSession::cursorAt(const FilmTime& now) {
    const auto position = positionAt(now.source);
    if (!position)
        return std::nullopt;
    const Snapshot& state = timeline_.at(now.source);
    const double stored = state.opacity.value_or(1);
    const double opacity = std::isfinite(stored) ? std::clamp(stored, 0.0, 1.0) : 1;
    return CursorState{*position, state.appearance, opacity * visibilityAt(now.source)};
}

std::vector<ShownClick> FilmSession::clicksAt(const FilmTime& now, double duration) const {
    constexpr std::size_t most = 8;
    constexpr std::size_t mostLooked = 64; // a button may be held for longer than others take for clicks
    std::vector<ShownClick> shown;
    auto after = std::upper_bound(clicks_.begin(), clicks_.end(), now.source,
                                  [](double time, const Click& click) { return time < click.start; });
    for (std::size_t looked = 0; looked < mostLooked && after != clicks_.begin() && shown.size() < most;
         --after, ++looked) {
        const Click& click = *(after - 1);
        const bool isHeld = now.source < click.end;
        auto age = times_.since(click.start, now);
        if (!age && isHeld) // a button that was down already at the cut
            age = times_.sinceCut(now);
        const auto position = positionAt(isHeld ? now.source : click.start);
        if (position && age && (*age < duration || isHeld))
            shown.push_back({*position, *age, isHeld});
    }
    return shown;
}

const KeyCaption* FilmSession::captionAt(double film) const {
    const std::vector<KeyCaption>& captions = filmInsights_.captions;
    const auto after = std::upper_bound(captions.begin(), captions.end(), film,
                                        [](double time, const KeyCaption& caption) { return time < caption.start; });
    if (after == captions.begin() || film >= (after - 1)->end)
        return nullptr;
    return &*(after - 1);
}

ScreenRect FilmSession::areaAt(double film) const {
    const ScreenRect area = filmInsights_.camera.at(film).area;
    const bool hasArea = area.width > 0 && area.height > 0;
    return hasArea ? area : region_;
}

std::vector<Zoom> readZooms(const std::string& file, const ScreenRect& region) {
    constexpr double most = 1e7;
    JsonFields fields(shortFile(file, "a list of zooms"), file, "zulm.zooms");
    std::vector<Zoom> zooms;
    const std::size_t count = fields.array("zooms");
    for (std::size_t i = 0; i < count; ++i) {
        const std::string path = fmt::format("zooms[{}]", i);
        Zoom zoom;
        ZoomPlace place;
        place.centre = {region.x + region.width / 2, region.y + region.height / 2};
        fields.section(path);
        for (const char* member : {".start", ".end"})
            if (!fields.has(path + member))
                fields.failAt(path, fmt::format("has no \"{}\"", member + 1));
        fields.number(path + ".start", 0, most, zoom.start);
        fields.number(path + ".end", 0, most, zoom.end);
        zoom.factor = 2;
        fields.number(path + ".factor", 1, 20, zoom.factor);
        fields.number(path + ".x", -most, most, place.centre.x);
        fields.number(path + ".y", -most, most, place.centre.y);
        if (zoom.end <= zoom.start || (!zooms.empty() && zoom.start < zooms.back().end))
            fields.failAt(path, "must end after its start, and begin after the zoom before it");
        place.area = zoomedArea(region, place.centre, zoom.factor);
        place.centre = {place.area.x + place.area.width / 2, place.area.y + place.area.height / 2};
        place.start = zoom.start;
        place.first = zoom.end;
        zoom.places.push_back(place);
        zooms.push_back(std::move(zoom));
    }
    fields.requireNothingLeft();
    return zooms;
}

} // namespace Render
