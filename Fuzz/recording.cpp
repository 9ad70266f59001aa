// Any bytes as a recording: its tracks, what holds at some times, the insights, and the streams of an edited movie.

#include "Fuzz/Target.h"
#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <cmath>
#include <limits>

using namespace ZULMetaData;

namespace {

constexpr const char* s_name = "recording";

template <class Kind>
void requireOrder(const Track<Kind>& track) {
    if (track.times().size() != track.values().size())
        Fuzz::fail("a time without a value");
    for (std::size_t i = 0; i < track.size(); ++i)
        if (!std::isfinite(track.times()[i]) || (i > 0 && track.times()[i] < track.times()[i - 1]))
            Fuzz::fail("a time out of order");
}

/// Calls `work`, whose only error is one about the recording.
template <class Work>
void orNamedError(Work work) {
    try {
        work();
    } catch (const Error& error) {
        if (error.file() != s_name || error.sentence().empty())
            Fuzz::fail(error.what());
    }
}

void readTracks(const Recording& recording) {
    RecordedKinds::forEach([&]<class Kind>() {
        orNamedError([&] {
            const Track<Kind>& track = recording.track<Kind>();
            requireOrder(track);
            std::size_t entries = 0;
            recording.read<Kind>([&](double, const TrackValueOf<Kind>&) { return ++entries > 0; });
            if (entries != track.size() + track.leftOut())
                Fuzz::fail("a walk with other entries");
        });
    });
}

bool areAlike(const Snapshot& left, const Snapshot& right) {
    return left.cursor.has_value() == right.cursor.has_value() && left.appearance == right.appearance &&
           left.buttons == right.buttons && left.modifiers == right.modifiers && left.title == right.title &&
           left.keys.size() == right.keys.size() && left.window == right.window && left.slide.text == right.slide.text;
}

/// A timeline shows the same wherever it was before.
void playThrough(const Recording& recording) {
    constexpr double infinity = std::numeric_limits<double>::infinity();
    Timeline timeline(recording);
    for (const double time : {0.0, 0.1, 1.0, -1.0, 2.5, 1e9, 0.5, infinity, -infinity, std::nan(""), 1e300, 3.0})
        if (!areAlike(timeline.at(time), recording.at(time)))
            Fuzz::fail("another state");
}

void find(const Recording& recording) {
    const Insights insights = insightsOf(insightSourcesOf(recording, [](const Error&) {}));
    double end = 0;
    for (const Zoom& zoom : insights.zooms) {
        if (!(zoom.start >= end) || !(zoom.end >= zoom.start) || !(zoom.end <= insights.duration))
            Fuzz::fail("zooms that overlap");
        end = zoom.end;
    }
    double last = -std::numeric_limits<double>::infinity();
    for (const double time : insights.path.times()) {
        if (!(time >= last))
            Fuzz::fail("a path that goes back");
        last = time;
    }
    for (const double time : {0.0, 1.0, end})
        if (!std::isfinite(insights.camera.at(time).zoom))
            Fuzz::fail("a camera without a picture");
}

void retime(const Recording& recording) {
    EditList edits;
    edits.keep(1, {7, 3}, {3, 7});
    edits.hold({1, 10}, 2);
    edits.keep(0, 1'000'000'000);
    for (const EditedStream& stream : retimed(recording, edits).streams) {
        if (stream.isCopied)
            continue;
        StreamEntries entries(stream.bytes);
        std::uint64_t count = 0;
        while (entries.next())
            ++count;
        if (count != stream.counts.written())
            Fuzz::fail("other entries than were counted");
    }
}

} // namespace

void runTarget(std::string_view bytes) {
    orNamedError([&] {
        const Recording recording(ByteSource::memory(bytes), s_name);
        recording.duration();
        recording.creators();
        recording.hiddenStreams();
        readTracks(recording);
        orNamedError([&] { playThrough(recording); });
        orNamedError([&] { find(recording); });
        orNamedError([&] { retime(recording); });
    });
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
}
