#pragma once

// What is computed once for all snapshots of a recording.

#include "ZULMetaDataSession/Snapshot.h"
#include "ZULMetaDataSession/TimeIndex.h"
#include "ZULMetaDataSession/Track.h"

#include <array>
#include <cstddef>
#include <span>
#include <tuple>
#include <vector>

namespace ZULMetaData::detail {

/// Returns the position after so many entries, as `cursorPositionAt` does.
std::optional<ScreenPoint> positionAfter(std::span<const double> times, std::span<const Point> points,
                                         std::size_t count, double time, Interpolation interpolation, double usual);

/// The kinds that a snapshot shows.
using ShownKinds =
    KindList<CursorLocationKind, CursorImageKind, CursorOpacityKind, CursorActionKind, KeyboardActionKind,
             TopmostWindowKind, TopmostWindowTitleKind, TopmostAppNameKind, SlideInfoTitleKind, SlideInfoTextKind,
             SlideInfoCommentKind, HoverRectKind, RecordingRegionKind, ScaleFactorKind, CPUUsageKind>;

/// For each of these kinds, how many of its entries have happened.
using EntryCounts = std::array<std::size_t, ShownKinds::size>;

/// Returns what of the screen was recorded.
RecordedArea areaOf(const Track<RecordingRegionKind>& regions, const Track<ScaleFactorKind>& scales);

/// The tracks of the kinds, and what follows from them. Any number of threads may use it.
class RecordingStates {
public:
    /// `trackOf.template operator()<Kind>()` returns the track of a kind.
    template <class TrackOf>
    explicit RecordingStates(TrackOf trackOf) {
        ShownKinds::forEach([&]<class Kind>() {
            auto& track = std::get<Track<Kind>>(tracks_);
            track = trackOf.template operator()<Kind>();
            indices_[placeOf<Kind>()] = TimeIndex(track.times());
        });
        prepare();
    }

    /// Returns the times of the kind at this place of the list.
    std::span<const double> times(std::size_t place) const { return indices_[place].times(); }

    /// Returns how many entries of each kind have a time at or before `time`.
    EntryCounts countsUntil(double time) const;

    /// Shows what holds after so many entries, but for the position of the cursor, which `showCursor` shows.
    void show(const EntryCounts& counts, Snapshot& snapshot) const;

    /// The same for one kind alone. The others are up to date.
    void show(std::size_t place, const EntryCounts& counts, Snapshot& snapshot) const;

    /// Shows the cursor at the time of the snapshot.
    void showCursor(const EntryCounts& counts, Interpolation interpolation, Snapshot& snapshot) const;

private:
    /// What is known after a cursor action.
    struct AfterAction {
        MouseButtons buttons;
        Modifiers modifiers;
        double toldAt = 0; ///< when an action told them; before all times if none did
    };

    template <class Kind>
    static constexpr std::size_t placeOf() {
        return TracksOf<ShownKinds>::placeOf<Kind>();
    }
    template <class Kind>
    const Track<Kind>& track() const {
        return std::get<Track<Kind>>(tracks_);
    }

    void prepare();
    template <class Kind>
    void showKind(const EntryCounts& counts, Snapshot& snapshot) const;
    void showModifiers(const EntryCounts& counts, Snapshot& snapshot) const;

    TracksOf<ShownKinds>::Type tracks_;
    std::array<TimeIndex, ShownKinds::size> indices_;
    std::vector<AfterAction> afterActions_;
    double usualDistance_ = 0;
    RecordedArea area_;
};

} // namespace ZULMetaData::detail
