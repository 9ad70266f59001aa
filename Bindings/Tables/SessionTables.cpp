#include "Bindings/Tables/SessionTables.h"

#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/Insights/CursorSpeed.h"
#include "ZULMetaDataSession/Insights/Insights.h"
#include "ZULMetaDataSession/Retiming.h"
#include "ZULMetaDataSession/Snapshot.h"
#include "ZULMetaDataSession/Timeline.h"

#include <algorithm>
#include <array>
#include <limits>
#include <stdexcept>
#include <type_traits>
#include <utility>

namespace ZULMetaData::Bindings {

namespace {

constexpr double s_unknown = std::numeric_limits<double>::quiet_NaN();

/// Returns the names of the values of a set, with a plus sign between two of them.
template <class Enum, std::size_t count>
Text namesIn(const std::optional<EnumSet<Enum>>& set, const std::array<Enum, count>& all) {
    if (!set)
        return std::nullopt;
    std::string names;
    for (const Enum value : all)
        if (set->contains(value))
            names.append(names.empty() ? "" : "+").append(nameOf(value));
    return names;
}

Text namesOf(const std::optional<MouseButtons>& buttons) {
    return namesIn(buttons, s_mouseButtons);
}

Text namesOf(const std::optional<Modifiers>& modifiers) {
    return namesIn(modifiers, s_modifiers);
}

Text textOf(const std::optional<std::string_view>& text) {
    return text ? Text(*text) : std::nullopt;
}

template <class Number>
double numberOr(const std::optional<Number>& number) {
    return number ? static_cast<double>(*number) : s_unknown;
}

/// Returns a member of what is known, or not a number.
template <class Known, class Member>
double memberOf(const std::optional<Known>& known, Member Known::*member) {
    return known ? static_cast<double>((*known).*member) : s_unknown;
}

/// The columns of the states, which are filled row by row because a snapshot refers to its recording.
class StateRows {
public:
    void add(const Snapshot& state) {
        number("x", memberOf(state.cursor, &ScreenPoint::x));
        number("y", memberOf(state.cursor, &ScreenPoint::y));
        addAppearance(state.appearance);
        number("opacity", numberOr(state.opacity));
        text("buttons", namesOf(state.buttons));
        text("modifiers", namesOf(state.modifiers));
        addRect({"window_x", "window_y", "window_width", "window_height"}, state.window);
        text("title", textOf(state.title));
        text("application", textOf(state.application));
        text("slide_title", textOf(state.slide.title));
        text("slide_text", textOf(state.slide.text));
        text("slide_comment", textOf(state.slide.comment));
        addRect({"hover_x", "hover_y", "hover_width", "hover_height"}, state.hover);
        addRect({"region_x", "region_y", "region_width", "region_height"}, state.region);
        number("scale", numberOr(state.scale));
        number("cpu", numberOr(state.cpu));
        column_ = 0;
    }

    /// Returns the columns. Without any row they have their names and types too.
    std::vector<TableColumn> take() {
        if (columns_.empty()) {
            add(Snapshot());
            for (TableColumn& column : columns_)
                std::visit([](auto& values) { values.clear(); }, column.values);
        }
        return std::move(columns_);
    }

private:
    void number(const char* name, double value) { add(name, value); }
    void text(const char* name, Text value) { add(name, std::move(value)); }

    void addAppearance(const CursorAppearance* appearance) {
        const CursorPicture* picture = appearance ? appearance->picture.get() : nullptr;
        text("cursor_id", appearance ? Text(std::to_string(appearance->id)) : std::nullopt);
        number("hotspot_x", picture ? picture->hotSpot.x : s_unknown);
        number("hotspot_y", picture ? picture->hotSpot.y : s_unknown);
        add("picture", picture ? Blob(appearance->picture, &picture->bytes) : nullptr);
    }

    void addRect(const std::array<const char*, 4>& names, const std::optional<Rect>& rect) {
        constexpr std::array members{&Rect::x, &Rect::y, &Rect::width, &Rect::height};
        for (std::size_t i = 0; i < names.size(); ++i)
            number(names[i], memberOf(rect, members[i]));
    }

    template <class Value>
    void add(const char* name, Value value) {
        if (column_ == columns_.size())
            columns_.push_back({name, std::vector<Value>()});
        std::get<std::vector<Value>>(columns_[column_++].values).push_back(std::move(value));
    }

    std::vector<TableColumn> columns_;
    std::size_t column_ = 0; ///< the next one of this row
};

/// The parameters of a table, and how its rows are made.
struct InsightTable {
    /// Changes one of the options. A number that is no number of things counts as none.
    struct Parameter {
        const char* name;
        void (*set)(InsightOptions&, double);
    };

    const char* name;
    std::vector<Parameter> parameters;
    Table (*rows)(const InsightSources&, const InsightOptions&, double rate);
};

/// Returns a function that sets a member of some of the options.
template <auto Part, auto Member>
void setOption(InsightOptions& options, double value) {
    auto& member = options.*Part.*Member;
    using Value = std::remove_reference_t<decltype(member)>;
    if constexpr (std::is_same_v<Value, bool>)
        member = value != 0;
    else if constexpr (std::is_same_v<Value, std::size_t>)
        member = value > 0 ? static_cast<std::size_t>(std::min(value, 1e9)) : 0;
    else
        member = value;
}

template <class Rows>
std::vector<double> startsOf(const Rows& rows) {
    std::vector<double> starts;
    starts.reserve(rows.size());
    for (const auto& row : rows)
        starts.push_back(row.start);
    return starts;
}

double xOf(const std::optional<Point>& point) {
    return memberOf(point, &Point::x);
}

double yOf(const std::optional<Point>& point) {
    return memberOf(point, &Point::y);
}

std::vector<Click> clicksIn(const InsightSources& sources, const InsightOptions& options) {
    return clicksOf(sources.actions, sources.positions, sources.duration, options.clicks);
}

CursorPath pathIn(const InsightSources& sources, const InsightOptions& options) {
    return {sources.positions, clicksIn(sources, options), options.path};
}

std::vector<Zoom> zoomsIn(const InsightSources& sources, const InsightOptions& options) {
    return zoomsOf(clicksIn(sources, options), sources.keys, sources.positions, sources.windows, sources.screen,
                   sources.duration, options.zooms);
}

Table clickRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<Click> clicks = clicksIn(sources, options);
    Table table{startsOf(clicks), {}, {}};
    table.add("end", clicks, [](const Click& click) { return click.end; });
    table.add("button", clicks, [](const Click& click) { return Text(nameOf(click.button)); });
    table.add("modifiers", clicks, [](const Click& click) { return namesOf(std::optional(click.modifiers)); });
    table.add("x", clicks, [](const Click& click) { return xOf(click.position); });
    table.add("y", clicks, [](const Click& click) { return yOf(click.position); });
    table.add("end_x", clicks, [](const Click& click) { return xOf(click.endPosition); });
    table.add("end_y", clicks, [](const Click& click) { return yOf(click.endPosition); });
    table.add("count", clicks, [](const Click& click) { return std::int32_t{click.count}; });
    table.add("is_drag", clicks, [](const Click& click) { return std::int32_t{click.isDrag}; });
    table.add("is_released", clicks, [](const Click& click) { return std::int32_t{click.isReleased}; });
    return table;
}

/// One row for each key, because captions grow while they are shown.
Table captionRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<KeyCaption> captions = keyCaptions(sources.keys, options.captions, sources.duration);
    struct Row {
        const KeyCaption* caption;
        const CaptionKey* key;
        std::int32_t first;
    };
    std::vector<Row> rows;
    Table table;
    for (const KeyCaption& caption : captions) {
        const auto first = static_cast<std::int32_t>(rows.size());
        for (const CaptionKey& key : caption.keys) {
            rows.push_back({&caption, &key, first});
            table.times.push_back(key.time);
        }
    }
    table.add("label", rows, [](const Row& row) { return Text(row.key->label); });
    table.add("is_typed", rows, [](const Row& row) { return std::int32_t{row.key->isTyped}; });
    table.add("first", rows, [](const Row& row) { return row.first; });
    table.add("end", rows, [](const Row& row) { return row.caption->end; });
    return table;
}

Table idleRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<IdleSpan> spans = idleSpansOf(sources.positions, sources.actions, sources.keys, sources.scrolling,
                                                    sources.duration, options.idle);
    Table table{startsOf(spans), {}, {}};
    table.add("end", spans, [](const IdleSpan& span) { return span.end; });
    return table;
}

Table chapterRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<Chapter> chapters =
        chaptersOf(sources.titles, sources.applications, sources.slides, sources.duration, options.chapters);
    Table table{startsOf(chapters), {}, {}};
    table.add("end", chapters, [](const Chapter& chapter) { return chapter.end; });
    table.add("title", chapters, [](const Chapter& chapter) { return Text(chapter.title); });
    table.add("application", chapters, [](const Chapter& chapter) { return Text(chapter.application); });
    return table;
}

/// One row for each place of a zoom.
Table zoomRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<Zoom> zooms = zoomsIn(sources, options);
    struct Row {
        const Zoom* zoom;
        const ZoomPlace* place;
    };
    std::vector<Row> rows;
    Table table;
    for (const Zoom& zoom : zooms)
        for (const ZoomPlace& place : zoom.places) {
            rows.push_back({&zoom, &place});
            table.times.push_back(place.start);
        }
    table.add("zoom_start", rows, [](const Row& row) { return row.zoom->start; });
    table.add("zoom_end", rows, [](const Row& row) { return row.zoom->end; });
    table.add("factor", rows, [](const Row& row) { return row.zoom->factor; });
    table.add("x", rows, [](const Row& row) { return row.place->area.x; });
    table.add("y", rows, [](const Row& row) { return row.place->area.y; });
    table.add("width", rows, [](const Row& row) { return row.place->area.width; });
    table.add("height", rows, [](const Row& row) { return row.place->area.height; });
    table.add("is_typing", rows, [](const Row& row) { return std::int32_t{row.place->reason == ZoomReason::Typing}; });
    return table;
}

/// Returns the times from 0 to the end of the recording, `rate` in a second.
std::vector<double> timesAt(double rate, double duration) {
    constexpr double most = 1e7;
    if (!(rate > 0) || !(rate * duration < most))
        throw std::invalid_argument("rate: must be above 0, and make fewer than ten million rows");
    std::vector<double> times(static_cast<std::size_t>(rate * duration) + 1);
    for (std::size_t i = 0; i < times.size(); ++i)
        times[i] = static_cast<double>(i) / rate;
    return times;
}

Table pathRows(const InsightSources& sources, const InsightOptions& options, double rate) {
    const CursorPath path = pathIn(sources, options);
    Table table;
    table.times = timesAt(rate, sources.duration);
    if (path.empty())
        table.times.clear();
    const auto placeAt = [&path](double time) { return path.at(time).value_or(ScreenPoint()); };
    table.add("x", table.times, [&](double time) { return placeAt(time).x; });
    table.add("y", table.times, [&](double time) { return placeAt(time).y; });
    return table;
}

Table speedRows(const InsightSources& sources, const InsightOptions&, double) {
    const std::vector<CursorSpeed> speeds = cursorSpeedsOf(sources.positions);
    Table table{startsOf(speeds), {}, {}};
    table.add("speed", speeds, [](const CursorSpeed& speed) { return speed.speed; });
    return table;
}

Table cameraRows(const InsightSources& sources, const InsightOptions& options, double rate) {
    const Camera camera(zoomsIn(sources, options), pathIn(sources, options), sources.screen, options.camera);
    Table table{timesAt(rate, sources.duration), {}, {}};
    std::vector<CameraView> views;
    views.reserve(table.times.size());
    for (const double time : table.times)
        views.push_back(camera.at(time));
    table.add("zoom", views, [](const CameraView& view) { return view.zoom; });
    table.add("x", views, [](const CameraView& view) { return view.area.x; });
    table.add("y", views, [](const CameraView& view) { return view.area.y; });
    table.add("width", views, [](const CameraView& view) { return view.area.width; });
    table.add("height", views, [](const CameraView& view) { return view.area.height; });
    return table;
}

/// One row.
Table activityRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::array rows{activityOf(sources, options)};
    const auto count = [](std::size_t number) { return static_cast<double>(number); };
    Table table{startsOf(rows), {}, {}};
    table.add("end", rows, [](const Activity& activity) { return activity.end; });
    table.add("clicks", rows, [&](const Activity& activity) { return count(activity.clicks); });
    table.add("keys", rows, [&](const Activity& activity) { return count(activity.keys); });
    table.add("scrolls", rows, [&](const Activity& activity) { return count(activity.scrolls); });
    table.add("idle", rows, [](const Activity& activity) { return activity.idle; });
    table.add("distance", rows, [](const Activity& activity) { return activity.distance; });
    return table;
}

/// One row for each application.
Table applicationRows(const InsightSources& sources, const InsightOptions& options, double) {
    const std::vector<ApplicationTime> applications = activityOf(sources, options).applications;
    Table table;
    for (const ApplicationTime& application : applications)
        table.times.push_back(application.first);
    table.add("name", applications, [](const ApplicationTime& application) { return Text(application.name); });
    table.add("duration", applications, [](const ApplicationTime& application) { return application.duration; });
    return table;
}

constexpr double s_usualRate = 30; // rows in a second

const std::vector<InsightTable>& insightTables() {
    using Options = InsightOptions;
    static const std::vector<InsightTable> tables{
        {"clicks",
         {{"multiple_time", setOption<&Options::clicks, &ClickOptions::multipleTime>},
          {"multiple_distance", setOption<&Options::clicks, &ClickOptions::multipleDistance>},
          {"drag_distance", setOption<&Options::clicks, &ClickOptions::dragDistance>},
          {"unreleased", setOption<&Options::clicks, &ClickOptions::unreleased>}},
         clickRows},
        {"captions",
         {{"shows_keys", setOption<&Options::captions, &KeyCaptionOptions::showsKeys>},
          {"shows_shortcuts", setOption<&Options::captions, &KeyCaptionOptions::showsShortcuts>},
          {"pause", setOption<&Options::captions, &KeyCaptionOptions::pause>},
          {"hold", setOption<&Options::captions, &KeyCaptionOptions::hold>},
          {"line_length", setOption<&Options::captions, &KeyCaptionOptions::lineLength>}},
         captionRows},
        {"idle", {{"least", setOption<&Options::idle, &IdleOptions::least>}}, idleRows},
        {"chapters",
         {{"least", setOption<&Options::chapters, &ChapterOptions::least>},
          {"flicker", setOption<&Options::chapters, &ChapterOptions::flicker>}},
         chapterRows},
        {"zooms",
         {{"group_time", setOption<&Options::zooms, &ZoomOptions::groupTime>},
          {"group_distance", setOption<&Options::zooms, &ZoomOptions::groupDistance>},
          {"typing_gap", setOption<&Options::zooms, &ZoomOptions::typingGap>},
          {"typing_keys", setOption<&Options::zooms, &ZoomOptions::typingKeys>},
          {"lead", setOption<&Options::zooms, &ZoomOptions::lead>},
          {"hold", setOption<&Options::zooms, &ZoomOptions::hold>},
          {"merge_gap", setOption<&Options::zooms, &ZoomOptions::mergeGap>},
          {"least", setOption<&Options::zooms, &ZoomOptions::least>},
          {"factor", setOption<&Options::zooms, &ZoomOptions::factor>},
          {"stop_time", setOption<&Options::zooms, &ZoomOptions::stopTime>}},
         zoomRows},
        {"cursor_path",
         {{"min_cutoff", setOption<&Options::path, &CursorPathOptions::minCutoff>},
          {"beta", setOption<&Options::path, &CursorPathOptions::beta>},
          {"speed_cutoff", setOption<&Options::path, &CursorPathOptions::speedCutoff>},
          {"rest", setOption<&Options::path, &CursorPathOptions::rest>}},
         pathRows},
        {"cursor_speed", {}, speedRows},
        {"camera",
         {{"settle_time", setOption<&Options::camera, &CameraOptions::settleTime>},
          {"follows_cursor", setOption<&Options::camera, &CameraOptions::followsCursor>},
          {"dead_zone", setOption<&Options::camera, &CameraOptions::deadZone>}},
         cameraRows},
        {"activity",
         {{"start", setOption<&Options::activity, &ActivitySpan::start>},
          {"end", setOption<&Options::activity, &ActivitySpan::end>},
          {"least", setOption<&Options::idle, &IdleOptions::least>}},
         activityRows},
        {"applications",
         {{"start", setOption<&Options::activity, &ActivitySpan::start>},
          {"end", setOption<&Options::activity, &ActivitySpan::end>}},
         applicationRows},
    };
    return tables;
}

/// Sets the options, and returns the rate of the rows.
double applyParameters(const InsightTable& table, const InsightParameters& parameters, InsightOptions& options) {
    double rate = s_usualRate;
    const bool hasRate = table.rows == pathRows || table.rows == cameraRows;
    for (const auto& [name, value] : parameters) {
        const auto found = std::find_if(table.parameters.begin(), table.parameters.end(),
                                        [&name = name](const auto& parameter) { return name == parameter.name; });
        if (hasRate && name == "rate")
            rate = value;
        else if (found == table.parameters.end())
            throw std::invalid_argument(std::string(table.name) + " has no parameter " + name);
        else
            found->set(options, value);
    }
    return rate;
}

Blob bytesOf(const EditedStream& stream) {
    auto bytes = std::make_shared<std::vector<std::uint8_t>>(static_cast<std::size_t>(stream.bytes.size()));
    bytes->resize(stream.bytes.read(0, {reinterpret_cast<char*>(bytes->data()), bytes->size()}));
    return bytes;
}

/// Returns a function that notes what cannot be read.
auto warningOf(std::vector<std::string>& warnings) {
    return [&warnings](const Error& error) { warnings.push_back(error.sentence()); };
}

EditList listIn(const EditText& edits, const Recording& recording) {
    EditListOptions options;
    if (const std::optional<double> duration = recording.duration())
        options.duration = Rational::of(*duration);
    if (!edits.frameRate.empty()) {
        options.frameRate = Rational::parse(edits.frameRate);
        if (!options.frameRate || options.frameRate->isZero())
            throw std::invalid_argument(edits.frameRate + " is no frame rate such as 25, 29.97 or 30000/1001");
    }
    return EditList::open(ByteSource::memory(edits.text), edits.name, options);
}

} // namespace

Table statesTable(const Recording& recording, std::span<const double> times, Interpolation interpolation) {
    Table table;
    table.times.assign(times.begin(), times.end());
    Timeline timeline(recording, warningOf(table.warnings), interpolation);
    StateRows rows;
    for (const double time : times)
        rows.add(timeline.at(time));
    table.columns = rows.take();
    return table;
}

std::vector<const char*> insightNames() {
    std::vector<const char*> names;
    names.reserve(insightTables().size());
    for (const InsightTable& table : insightTables())
        names.push_back(table.name);
    return names;
}

Table insightTable(const Recording& recording, std::string_view name, const InsightParameters& parameters) {
    for (const InsightTable& table : insightTables())
        if (name == table.name) {
            InsightOptions options;
            const double rate = applyParameters(table, parameters, options);
            std::vector<std::string> warnings;
            Table rows = table.rows(insightSourcesOf(recording, warningOf(warnings)), options, rate);
            rows.warnings = std::move(warnings);
            return rows;
        }
    throw std::invalid_argument("there are no insights " + std::string(name));
}

Table retimedTable(const Recording& recording, const EditText& edits) {
    EditedRecording edited = retimed(recording, listIn(edits, recording));
    const std::vector<EditedStream>& streams = edited.streams;
    const auto count = [](std::uint64_t number) { return static_cast<double>(number); };
    Table table;
    table.times.resize(streams.size());
    table.warnings = std::move(edited.warnings);
    table.warnings.insert(table.warnings.end(), edited.losses.begin(), edited.losses.end());
    table.add("kind", streams, [](const EditedStream& stream) { return Text(stream.source.name()); });
    table.add("bytes", streams, bytesOf);
    table.add("is_copied", streams, [](const EditedStream& stream) { return std::int32_t{stream.isCopied}; });
    table.add("moved", streams, [&](const EditedStream& stream) { return count(stream.counts.moved); });
    table.add("carried", streams, [&](const EditedStream& stream) { return count(stream.counts.carried); });
    table.add("added", streams, [&](const EditedStream& stream) { return count(stream.counts.added); });
    table.add("left_out", streams, [&](const EditedStream& stream) { return count(stream.counts.leftOut); });
    return table;
}

} // namespace ZULMetaData::Bindings
