#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <limits>
#include <optional>

namespace ZULMetaData::detail {

namespace {

constexpr double s_never = -std::numeric_limits<double>::infinity();

template <class Kind>
constexpr std::size_t s_placeOf = TracksOf<ShownKinds>::placeOf<Kind>();

void press(MouseButtons& buttons, const ButtonAction& action) {
    if (action.button && action.isPress)
        buttons.insert(*action.button);
    else if (action.button)
        buttons.erase(*action.button);
}

/// Show the value of an entry in the fields of its kind.
///@{
template <class Kind>
struct Shown;
template <>
struct Shown<CursorImageKind> {
    static void show(const CursorAppearance* value, Snapshot& snapshot) { snapshot.appearance = value; }
};

/// A kind whose value is copied.
template <auto Member>
struct ShownCopy {
    template <class Value>
    static void show(const Value* value, Snapshot& snapshot) {
        if (value)
            snapshot.*Member = *value;
        else
            (snapshot.*Member).reset();
    }
};
template <>
struct Shown<CursorOpacityKind> : ShownCopy<&Snapshot::opacity> {};
template <>
struct Shown<TopmostWindowKind> : ShownCopy<&Snapshot::window> {};
template <>
struct Shown<TopmostWindowTitleKind> : ShownCopy<&Snapshot::title> {};
template <>
struct Shown<TopmostAppNameKind> : ShownCopy<&Snapshot::application> {};
template <>
struct Shown<HoverRectKind> : ShownCopy<&Snapshot::hover> {};
template <>
struct Shown<RecordingRegionKind> : ShownCopy<&Snapshot::region> {};
template <>
struct Shown<ScaleFactorKind> : ShownCopy<&Snapshot::scale> {};
template <>
struct Shown<CPUUsageKind> : ShownCopy<&Snapshot::cpu> {};

/// A text of the slide.
template <auto Member>
struct ShownOnSlide {
    static void show(const std::string* value, Snapshot& snapshot) {
        snapshot.slide.*Member = value ? std::optional<std::string_view>(*value) : std::nullopt;
    }
};
template <>
struct Shown<SlideInfoTitleKind> : ShownOnSlide<&Slide::title> {};
template <>
struct Shown<SlideInfoTextKind> : ShownOnSlide<&Slide::text> {};
template <>
struct Shown<SlideInfoCommentKind> : ShownOnSlide<&Slide::comment> {};
///@}

} // namespace

RecordedArea areaOf(const Track<RecordingRegionKind>& regions, const Track<ScaleFactorKind>& scales) {
    RecordedArea area;
    for (const Rect& region : regions.values())
        if (region.width > 0 && region.height > 0)
            area.region = region;
    if (!scales.empty())
        area.scale = scales.values().back();
    return area;
}

void RecordingStates::prepare() {
    usualDistance_ = usualDistance(track<CursorLocationKind>().times());
    area_ = areaOf(track<RecordingRegionKind>(), track<ScaleFactorKind>());
    const auto& actions = track<CursorActionKind>();
    afterActions_.reserve(actions.size());
    AfterAction after;
    after.toldAt = s_never;
    for (std::size_t i = 0; i < actions.size(); ++i) {
        const ButtonAction& action = actions.values()[i];
        press(after.buttons, action);
        if (action.tellsModifiers()) {
            after.modifiers = action.modifiers;
            after.toldAt = actions.times()[i];
        }
        afterActions_.push_back(after);
    }
}

EntryCounts RecordingStates::countsUntil(double time) const {
    std::array<TimeIndex::Slot, ShownKinds::size> slots;
    for (std::size_t place = 0; place < slots.size(); ++place)
        slots[place] = indices_[place].slotOf(time);
    EntryCounts counts{};
    for (std::size_t place = 0; place < slots.size(); ++place)
        counts[place] = indices_[place].countUntil(slots[place], time);
    return counts;
}

template <class Kind>
void RecordingStates::showKind(const EntryCounts& counts, Snapshot& snapshot) const {
    const std::size_t count = counts[s_placeOf<Kind>];
    if constexpr (std::is_same_v<Kind, CursorLocationKind>) {
        return; // depends on the time
    } else if constexpr (std::is_same_v<Kind, CursorActionKind>) {
        snapshot.buttons = count == 0 ? std::nullopt : std::optional(afterActions_[count - 1].buttons);
        showModifiers(counts, snapshot);
    } else if constexpr (std::is_same_v<Kind, KeyboardActionKind>) {
        const Track<Kind>& keys = track<Kind>();
        snapshot.keys = {keys.times().first(count), keys.values().first(count)};
        showModifiers(counts, snapshot);
    } else {
        Shown<Kind>::show(count == 0 ? nullptr : &track<Kind>().values()[count - 1], snapshot);
    }
}

void RecordingStates::showModifiers(const EntryCounts& counts, Snapshot& snapshot) const {
    const std::size_t actions = counts[s_placeOf<CursorActionKind>];
    const std::size_t keys = counts[s_placeOf<KeyboardActionKind>];
    const double toldByAction = actions == 0 ? s_never : afterActions_[actions - 1].toldAt;
    const Track<KeyboardActionKind>& keyTrack = track<KeyboardActionKind>();
    if (keys > 0 && keyTrack.times()[keys - 1] >= toldByAction)
        snapshot.modifiers = keyTrack.values()[keys - 1].modifiers;
    else if (toldByAction != s_never)
        snapshot.modifiers = afterActions_[actions - 1].modifiers;
    else
        snapshot.modifiers.reset();
}

void RecordingStates::show(const EntryCounts& counts, Snapshot& snapshot) const {
    snapshot.area = area_;
    ShownKinds::forEach([&]<class Kind>() { showKind<Kind>(counts, snapshot); });
}

void RecordingStates::show(std::size_t place, const EntryCounts& counts, Snapshot& snapshot) const {
    ShownKinds::forEach([&]<class Kind>() {
        if (s_placeOf<Kind> == place)
            showKind<Kind>(counts, snapshot);
    });
}

void RecordingStates::showCursor(const EntryCounts& counts, Interpolation interpolation, Snapshot& snapshot) const {
    const auto& positions = track<CursorLocationKind>();
    const std::size_t count = counts[s_placeOf<CursorLocationKind>];
    snapshot.cursor =
        positionAfter(positions.times(), positions.values(), count, snapshot.time, interpolation, usualDistance_);
}

} // namespace ZULMetaData::detail
