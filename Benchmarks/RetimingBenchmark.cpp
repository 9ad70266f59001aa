// What a user waits for after a cut: the streams of a long recording for the edited movie.

#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"
#include "ZULMetaDataSession/Retiming.h"

#include <cstdint>
#include <fstream>
#include <string>

namespace ZULMetaData::Bench {

namespace {

constexpr int s_entries = 5'000'000;
constexpr int s_entriesOfASecond = 1000;
const std::string s_movie = scratchFolder() + "/recording.mp4";

/// Saves a recording with a position of the cursor in every millisecond.
void makeMovie() {
    const std::string stream = scratchFolder() + "/cursorLocation.dat";
    {
        MetaDataWriter<Point, int, int> writer;
        writer.init(stream, s_cursorLocationUUID, 1);
        for (int i = 0; i < s_entries; ++i)
            writer.write(i / double(s_entriesOfASecond), Point(i, -i), false);
    }
    std::ofstream(s_movie, std::ios::binary) << std::string("\0\0\0\x08mdat", 8);
    ZULMAtomWriter().writeMetaDataFiles({stream}, s_movie);
}

/// Keeps every entry once: pieces of five seconds at three speeds in turn, each pair in reverse order.
EditList edits() {
    constexpr int seconds = 5;
    constexpr int pieces = s_entries / s_entriesOfASecond / seconds;
    const Rational speeds[] = {1, 2, {3, 7}};
    EditList edits;
    for (int i = 0; i < pieces; ++i) {
        const int piece = i ^ 1;
        edits.keep(piece * seconds, (piece + 1) * seconds, speeds[i % 3]);
    }
    return edits;
}

bool isRight(const EditedRecording& edited) {
    constexpr std::uint64_t entrySize = 16;
    return edited.streams.size() == 1 && edited.losses.empty() && edited.streams[0].counts.moved == s_entries &&
           edited.streams[0].size == s_metaDataHeaderSize + edited.streams[0].counts.written() * entrySize;
}

void reportRetiming() {
    const Measure inMemory{"retime 5 million entries, in 1,000 pieces", "-", 1};
    const Measure throughSink{"the same in bounded memory", "-", 1};
    if (!isSelected(inMemory) && !isSelected(throughSink))
        return;
    makeMovie();
    const EditList list = edits();
    EditedRecording whole;
    EditedRecording passedOn;
    std::uint64_t bytes = 0;
    const Timing timing = timeSideBySide(
        {[&] { whole = retimed(Recording(FileLocation(s_movie)), list); }, [&] { whole = {}; }},
        {[&] {
             passedOn = retimed(Recording(FileLocation(s_movie)), list,
                                Callback<void(std::string_view)>([&](std::string_view part) { bytes += part.size(); }));
         },
         [&] { bytes = 0; }},
        1e9);
    if (!isRight(whole) || !isRight(passedOn) || bytes != passedOn.streams[0].size)
        return reportWrong(inMemory);
    reportFigure(inMemory, timing.baseline, "s");
    reportFigure(throughSink, timing.library, "s");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] { reportRetiming(); });
}
