// What an editor waits for when it opens a recording: its clicks, captions, idle time, chapters, cursor and zooms.

#include "Benchmarks/Runner.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"
#include "ZULMetaDataSession/ZULMetaDataSession.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <fstream>
#include <string>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr int s_milliseconds = 60 * 60 * 1000;
const std::string s_movie = scratchFolder() + "/hour.mp4";

/// The cursor moves for four seconds and rests for one.
Point positionAt(int millisecond) {
    const int moving = millisecond / 5000 * 4000 + std::min(millisecond % 5000, 4000);
    const double seconds = moving / 1000.0;
    return {static_cast<std::int32_t>(960 + 900 * std::sin(seconds * 1.7)),
            static_cast<std::int32_t>(540 + 500 * std::sin(seconds * 2.3))};
}

/// Saves an hour of lively work, with a position of the cursor in every millisecond.
void makeMovie() {
    const auto file = [](const std::string& name) { return scratchFolder() + "/" + name; };
    {
        MetaDataWriter<Point, int, int> positions;
        positions.init(file("cursorLocation"), s_cursorLocationUUID, 1);
        CursorActionMetaDataWriter actions(file("cursorAction"));
        KeyboardActionMetaDataWriter keys(file("keyboardAction"));
        TopmostWindowTitleMetaDataWriter titles(file("topmostWindowTitle"));
        TopmostAppNameMetaDataWriter applications(file("topmostAppName"));
        RecordingRegionMetaDataWriter(file("recordingRegion")).writeAndFinalize(ScreenRect(0, 0, 1920, 1080));
        for (int now = 0; now < s_milliseconds; ++now) {
            const MediaTime time(now, 1000);
            positions.write(now / 1000.0, positionAt(now), false);
            if (now % 4000 == 1000)
                actions.write(storedButtonAction(MouseButton::Left, true), time);
            if (now % 4000 == 1080)
                actions.write(storedButtonAction(MouseButton::Left, false), time);
            if (now % 250 == 0 && now / 10'000 % 2 == 0)
                keys.writeCharacterCode('a', 0, time);
            if (now % 30'000 == 0)
                titles.write(("Document " + std::to_string(now / 30'000)).c_str(), time);
            if (now % 90'000 == 0)
                applications.write(now % 180'000 == 0 ? "Editor" : "Browser", time);
        }
    }
    std::ofstream(s_movie, std::ios::binary) << std::string("\0\0\0\x08mdat", 8);
    ZULMAtomWriter().writeMetaDataFiles({file("cursorLocation"), file("cursorAction"), file("keyboardAction"),
                                         file("topmostWindowTitle"), file("topmostAppName"), file("recordingRegion")},
                                        s_movie);
}

bool isRight(const Insights& insights) {
    return insights.clicks.size() == 900 && insights.captions.size() == 180 && insights.chapters.size() == 120 &&
           insights.path.times().size() > 300'000 && !insights.zooms.empty();
}

void reportInsights() {
    const Measure insightsAlone{"all insights of an hour, cursor at 1 kHz", "-", 0.5};
    const Measure withReading{"the same, from a movie", "-", 0.5};
    if (!isSelected(insightsAlone) && !isSelected(withReading))
        return;
    makeMovie();
    const Recording recording(s_movie);
    const InsightSources sources = insightSourcesOf(recording, [](const Error& error) { throw error; });
    Insights insights;
    Insights fromMovie;
    const Timing timing = timeSideBySide({[&] { insights = insightsOf(sources); }},
                                         {[&] { fromMovie = insightsOf(Recording(s_movie)); }}, 1e9);
    if (!isRight(insights) || !isRight(fromMovie))
        return reportWrong(insightsAlone);
    reportFigure(insightsAlone, timing.baseline, "s");
    reportFigure(withReading, timing.library, "s");
}

void reportFrames() {
    const Measure measure{"cursor and camera of a frame", "-", 1000};
    if (!isSelected(measure))
        return;
    const Insights insights = insightsOf(Recording(s_movie));
    constexpr int frames = 216'000; // an hour
    double sum = 0;
    const Timing timing =
        timeSideBySide({[&] {
                           for (int frame = 0; frame < frames; ++frame)
                               sum += insights.path.at(frame / 60.0)->x + insights.camera.at(frame / 60.0).area.x;
                       }},
                       {[] {}}, frames);
    if (!(sum > 0))
        return reportWrong(measure);
    reportFigure(measure, timing.baseline, "ns");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        reportInsights();
        reportFrames();
    });
}
