#include "Bindings/Tables/SessionTables.h"

#include "ZULMetaDataSession/Retiming.h"
#include "ZULMetaDataSession/Snapshot.h"
#include "ZULMetaDataSession/Timeline.h"

#include <array>
#include <limits>

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
    return namesIn(buttons, std::array{MouseButton::Left, MouseButton::Right, MouseButton::Middle});
}

Text namesOf(const std::optional<Modifiers>& modifiers) {
    return namesIn(modifiers, std::array{Modifier::CapsLock, Modifier::Shift, Modifier::Control, Modifier::Alt,
                                         Modifier::Command, Modifier::Windows});
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

Blob bytesOf(const EditedStream& stream) {
    auto bytes = std::make_shared<std::vector<std::uint8_t>>(static_cast<std::size_t>(stream.bytes.size()));
    bytes->resize(stream.bytes.read(0, {reinterpret_cast<char*>(bytes->data()), bytes->size()}));
    return bytes;
}

} // namespace

Table statesTable(const Recording& recording, std::span<const double> times, Interpolation interpolation) {
    Timeline timeline(
        recording, [](const Error&) {}, interpolation);
    StateRows rows;
    for (const double time : times)
        rows.add(timeline.at(time));
    return {{times.begin(), times.end()}, rows.take()};
}

Table retimedTable(const Recording& recording, const EditList& edits) {
    const EditedRecording edited = retimed(recording, edits);
    const std::vector<EditedStream>& streams = edited.streams;
    const auto count = [](std::uint64_t number) { return static_cast<double>(number); };
    Table table{std::vector<double>(streams.size()), {}};
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
