#pragma once

// What holds at each frame of a recording that plays.
//
//     Timeline timeline(recording);
//     for (double time = 0; time < duration; time += 1.0 / 60)
//         draw(timeline.at(time));

#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "Recording.h"
#include "Snapshot.h"

#include <array>
#include <cstddef>
#include <memory>

namespace ZULMetaData {

namespace detail {

/// Remembers the entry of each kind that holds, and until when.
struct TimelinePlaces {
    static constexpr std::size_t count = 15; ///< of kinds

    std::array<std::size_t, count> entries{};
    std::array<double, count> from{};
    std::array<double, count> until{};
};

} // namespace detail

/// Remembers its place in every track, so that the next frame costs next to nothing. Any other time may be asked for as
/// well. One thread at a time may use a timeline; each thread may have its own. The tracks are shared with the
/// recording, and live at least as long as the timeline.
class ZULMETADATA_API Timeline {
public:
    /// Reads the tracks that were not read yet. Throws `Error` if one of them cannot be read.
    explicit Timeline(const Recording& recording, Interpolation interpolation = Interpolation::Linear);

    /// The same, but calls `leaveOut` with the error of each stream that cannot be decoded, and then goes on without
    /// the stream.
    Timeline(const Recording& recording, const Callback<void(const Error&)>& leaveOut,
             Interpolation interpolation = Interpolation::Linear);

    /// Returns what holds at a time. The snapshot changes at the next call. Its texts live as long as the timeline.
    const Snapshot& at(double time);

private:
    Timeline(std::shared_ptr<const detail::RecordingStates> states, Interpolation interpolation);

    bool stepTo(std::size_t place, double time);
    void jumpTo(double time);
    void setRange(std::size_t place);

    std::shared_ptr<const detail::RecordingStates> states_;
    Interpolation interpolation_;
    detail::TimelinePlaces places_;
    Snapshot snapshot_;
};

} // namespace ZULMetaData
