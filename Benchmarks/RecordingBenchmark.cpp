// Reading a recording as an editor does: one kind, all positions, and everything that holds at a time.

#include "Benchmarks/Baseline.h"
#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"
#include "ZULMetaDataSession/Timeline.h"

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <random>
#include <span>
#include <string>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr double s_hours = 8 * 3600; // seconds
const std::string s_movie = scratchFolder() + "/recording.mp4";
const std::string s_titles = scratchFolder() + "/topmostWindowTitle.dat";

/// Writes streams of a lively session of eight hours, and puts them into a movie.
class SessionMaker {
public:
    /// Entries at about this distance, in seconds.
    template <class Kind, class ValueOf>
    void add(double distance, ValueOf valueOf) {
        files_.push_back(scratchFolder() + "/" + metaDataKindName(Kind::type) + ".dat");
        MetaDataWriter<typename Kind::Value, int, int> writer;
        writer.init(files_.back().string(), Kind::type, Kind::version);
        int number = 0;
        for (double time = 0; time < s_hours; time += distance * std::uniform_real_distribution(0.9, 1.1)(random_))
            writer.write(time, valueOf(number++), false);
    }

    void makeMovie() {
        std::ofstream(s_movie, std::ios::binary) << std::string("\0\0\0\x08mdat", 8);
        ZULMAtomWriter().writeMetaDataFiles(files_, s_movie);
    }

private:
    std::mt19937 random_{18};
    std::vector<FileLocation> files_;
};

Rect rectOf(int number) {
    return {number % 1000, number % 700, 800, 600};
}

std::string textOf(int number) {
    return "Document " + std::to_string(number) + " - an editor for documents";
}

/// The cursor at 60 Hz and 1,440 titles; everything else as often as it changes.
void makeSession() {
    SessionMaker session;
    session.add<CursorLocationKind>(1 / 60.0, [](int i) { return Point(i % 1920, i % 1080); });
    session.add<CursorImageKind>(2, [](int i) {
        CursorImage cursor;
        cursor.uniqueId = static_cast<std::uint64_t>(i % 7);
        return cursor;
    });
    session.add<CursorOpacityKind>(10, [](int) { return 1.0; });
    session.add<CursorActionKind>(0.5, [](int i) { return i % 2 == 0 ? 1 : 2; });
    session.add<KeyboardActionKind>(0.25, [](int i) { return KeyStroke(65 + static_cast<std::uint32_t>(i) % 26, 0); });
    session.add<TopmostWindowKind>(10, rectOf);
    session.add<TopmostWindowTitleKind>(20, textOf);
    session.add<TopmostAppNameKind>(20, [](int) { return std::string("Editor"); });
    session.add<SlideInfoTitleKind>(60, textOf);
    session.add<SlideInfoTextKind>(60, textOf);
    session.add<SlideInfoCommentKind>(60, textOf);
    session.add<ScrollActionKind>(0.05, [](int i) { return Point(0, i % 10); });
    session.add<HoverRectKind>(0.1, rectOf);
    session.add<RecordingRegionKind>(s_hours, rectOf);
    session.add<ScaleFactorKind>(s_hours, [](int) { return 2; });
    session.add<CPUUsageKind>(1, [](int i) { return static_cast<float>(i % 100); });
    session.makeMovie();
}

void compareKinds() {
    using Titles = Track<TopmostWindowTitleKind>;
    Titles own;
    Titles amongOthers;
    const auto titlesIn = [](const std::string& file) {
        return Recording(FileLocation(file)).track<TopmostWindowTitleKind>();
    };
    compare({"read a kind of 1,440 entries out of a movie of 8 hours", "the same from a file of its own", 1.2},
            {[&] { own = titlesIn(s_titles); }}, {[&] { amongOthers = titlesIn(s_movie); }}, 1440, [&] {
                return own.size() > 1400 && std::equal(own.values().begin(), own.values().end(),
                                                       amongOthers.values().begin(), amongOthers.values().end());
            });
}

void countBytes() {
    const Measure measure{"bytes read for a kind of 1,440 entries out of a movie of 8 hours", "its own bytes", 1.2};
    if (!isSelected(measure))
        return;
    const ByteSource file = ByteSource::file(s_movie);
    std::uint64_t bytesRead = 0;
    const Recording recording(ByteSource(file.size(),
                                         [&](std::uint64_t position, std::span<char> bytes) {
                                             bytesRead += bytes.size();
                                             return file.read(position, bytes);
                                         }),
                              s_movie);
    bytesRead = 0;
    const std::size_t entries = recording.track<TopmostWindowTitleKind>().size();
    if (entries < 1400)
        return reportWrong(measure);
    reportFigure(measure, double(bytesRead) / double(std::filesystem::file_size(s_titles)), "x");
}

/// Times and positions as a track has them.
struct Positions {
    std::vector<double> times;
    std::vector<Point> points;
};

[[gnu::noinline]] Positions readRaw(const std::string& path, std::size_t entries) {
    constexpr std::size_t size = 16;
    Positions positions{std::vector<double>(entries), std::vector<Point>(entries)};
    std::size_t entry = 0;
    readBlocks(path, s_metaDataHeaderSize, [&](const char* bytes, std::size_t count) {
        for (std::size_t i = 0; i < count / size; ++i, ++entry) {
            positions.times[entry] = valueAt<double>(bytes + i * size);
            positions.points[entry] = valueAt<Point>(bytes + i * size + sizeof(double));
        }
        return count / size * size;
    });
    return positions;
}

void comparePositions() {
    constexpr int entries = 5'000'000;
    const Measure measure{"read 5 million positions into a track", "read(2) and a copy into two vectors", 1.3};
    if (!isSelected(measure))
        return;
    const std::string stream = scratchFolder() + "/positions.dat";
    {
        MetaDataWriter<Point, int, int> writer;
        writer.init(stream, s_cursorLocationUUID, 1);
        for (int i = 0; i < entries; ++i)
            writer.write(i / 1000.0, Point(i, -i), false);
    }
    Positions raw;
    Track<CursorLocationKind> track;
    compare(measure, {[&] { raw = readRaw(stream, entries); }, [&] { raw = {}; }},
            {[&] { track = Recording(FileLocation(stream)).track<CursorLocationKind>(); }, [&] { track = {}; }},
            entries,
            [&] { return track.size() == entries && track.values().back() == Point(entries - 1, 1 - entries); });
    std::filesystem::remove(stream);
}

/// Keeps what is shown from being optimised away.
std::uint64_t digest(const Snapshot& state) {
    return static_cast<std::uint64_t>(state.cursor ? state.cursor->x : 0) + state.title.value_or("").size() +
           (state.buttons ? state.buttons->bits() : 0);
}

void reportSnapshots() {
    const Measure random{"a snapshot of all kinds at any time of 8 hours", "-", 1000};
    const Measure next{"the next frame of a playing timeline", "-", 150};
    if (!isSelected(random) && !isSelected(next))
        return;
    constexpr std::size_t count = 200'000;
    const Recording recording{FileLocation(s_movie)};
    std::mt19937 generator(18);
    std::vector<double> times(count);
    for (double& time : times)
        time = std::uniform_real_distribution(0.0, s_hours)(generator);
    std::uint64_t anywhere = 0;
    std::uint64_t played = 0;
    Timeline timeline(recording);
    const Timing timing = timeSideBySide({[&] {
                                             for (const double time : times)
                                                 anywhere += digest(recording.at(time));
                                         }},
                                         {[&] {
                                             for (std::size_t frame = 0; frame < count; ++frame)
                                                 played += digest(timeline.at(static_cast<double>(frame) / 60));
                                         }},
                                         count);
    if (anywhere == 0 || played == 0 || digest(timeline.at(60)) != digest(recording.at(60)))
        return reportWrong(random);
    reportFigure(random, timing.baseline, "ns");
    reportFigure(next, timing.library, "ns");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        makeSession();
        compareKinds();
        countBytes();
        reportSnapshots();
        comparePositions();
    });
}
