#pragma once

// The entries of one kind in the order of their times.
//
//     const Track<CursorLocationKind> positions = recording.track<CursorLocationKind>();
//     if (const Point* position = positions.at(12.5))
//         std::cout << *position << '\n';

#include "TrackValues.h"

#include <algorithm>
#include <cassert>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <numeric>
#include <optional>
#include <span>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZULMetaData {

/// A kind of metadata that can be recorded and read.
template <class Kind>
concept RecordedKind = RecordedKinds::contains<Kind>;

/// Columns of times and values, immutable. Copies share them, and any number of threads may read them.
template <RecordedKind Kind>
class Track {
public:
    using Value = TrackValueOf<Kind>; ///< the type of its values

    /// Entries that follow one another in a track.
    struct Part {
        std::span<const double> times; ///< in seconds, ascending
        std::span<const Value> values; ///< as many

        std::size_t size() const { return times.size(); } ///< returns the number of entries
        bool empty() const { return times.empty(); }      ///< returns true if there are none
    };

    Track() = default; ///< creates an empty track

    /// Takes columns of equal length in the order of the stream. Entries whose time is not finite are left out; the
    /// others are ordered by time, and equal times keep their order.
    Track(std::vector<double> times, std::vector<Value> values);

    /// The same for times that ascend and are finite already, without a look at them.
    static Track inOrder(std::vector<double> times, std::vector<Value> values);

    std::size_t size() const { return whole().size(); }              ///< returns the number of entries
    bool empty() const { return whole().empty(); }                   ///< returns true if there are none
    std::span<const double> times() const { return whole().times; }  ///< in seconds, ascending and finite
    std::span<const Value> values() const { return whole().values; } ///< as many as `times`

    /// Returns how many entries of the stream are not in the track because their time is not finite.
    std::size_t leftOut() const { return columns_ ? columns_->leftOut : 0; }

    /// Returns how many entries have a time at or before `time`. The last of them holds then.
    std::size_t countUntil(double time) const {
        const auto isUntil = [time](double entry) { return entry <= time; };
        return static_cast<std::size_t>(std::partition_point(times().begin(), times().end(), isUntil) -
                                        times().begin());
    }

    /// Returns the value of the last entry at or before `time`, or null before the first.
    const Value* at(double time) const {
        const std::size_t count = countUntil(time);
        return count == 0 ? nullptr : &values()[count - 1];
    }

    /// Returns the entries with `from` <= time < `to`.
    Part between(double from, double to) const {
        const auto begin = std::lower_bound(times().begin(), times().end(), from);
        const auto end = std::lower_bound(begin, times().end(), std::max(from, to));
        const auto first = static_cast<std::size_t>(begin - times().begin());
        const auto count = static_cast<std::size_t>(end - begin);
        return {times().subspan(first, count), values().subspan(first, count)};
    }

private:
    struct Columns {
        std::vector<double> times;
        std::vector<Value> values;
        std::size_t leftOut = 0;
    };

    explicit Track(Columns columns);

    Part whole() const { return columns_ ? Part{columns_->times, columns_->values} : Part(); }

    std::shared_ptr<const Columns> columns_;
};

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

/// The tracks of a list of kinds.
template <class List>
struct TracksOf;
template <class... Kinds>
struct TracksOf<KindList<Kinds...>> {
    using Type = std::tuple<Track<Kinds>...>;

    /// Returns the place of a kind in the list.
    template <class Kind>
    static constexpr std::size_t placeOf() {
        std::size_t place = 0;
        static_cast<void>(((std::is_same_v<Kind, Kinds> ? true : (++place, false)) || ...));
        return place;
    }
};

/// Returns whether the times ascend and none of them is not a number.
inline bool ascend(std::span<const double> times) {
    bool isAscending = times.empty() || times.front() <= times.front();
    for (std::size_t i = 1; i < times.size(); ++i) // to the end, so that several are compared at once
        isAscending &= times[i - 1] <= times[i];
    return isAscending;
}

/// Returns whether the times ascend and are finite.
inline bool areInOrder(std::span<const double> times) {
    return times.empty() || (ascend(times) && std::isfinite(times.front()) && std::isfinite(times.back()));
}

/// Returns the numbers of the entries with a finite time, ordered by time.
inline std::vector<std::size_t> orderOf(std::span<const double> times) {
    std::vector<std::size_t> order(times.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::erase_if(order, [times](std::size_t entry) { return !std::isfinite(times[entry]); });
    std::stable_sort(order.begin(), order.end(),
                     [times](std::size_t left, std::size_t right) { return times[left] < times[right]; });
    return order;
}

} // namespace detail

template <RecordedKind Kind>
Track<Kind>::Track(Columns columns) {
    if constexpr (std::is_same_v<Value, CursorAppearance>)
        detail::sharePictures(columns.values);
    columns_ = std::make_shared<const Columns>(std::move(columns));
}

template <RecordedKind Kind>
Track<Kind> Track<Kind>::inOrder(std::vector<double> times, std::vector<Value> values) {
    assert(times.size() == values.size() && detail::areInOrder(times));
    return Track(Columns{std::move(times), std::move(values)});
}

template <RecordedKind Kind>
Track<Kind>::Track(std::vector<double> times, std::vector<Value> values) {
    assert(times.size() == values.size());
    if (detail::areInOrder(times)) {
        *this = inOrder(std::move(times), std::move(values));
        return;
    }
    const std::vector<std::size_t> order = detail::orderOf(times);
    Columns columns;
    columns.times.reserve(order.size());
    columns.values.reserve(order.size());
    columns.leftOut = times.size() - order.size();
    for (const std::size_t entry : order) {
        columns.times.push_back(times[entry]);
        columns.values.push_back(std::move(values[entry]));
    }
    *this = Track(std::move(columns));
}

} // namespace ZULMetaData
