// Putting the streams into the movie at the end of a recording.

#include "Benchmarks/Baseline.h"
#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <cstdlib>
#include <filesystem>
#include <sys/mman.h>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

const std::string s_movie = scratchFolder() + "/movie.mp4";
const std::string s_copy = scratchFolder() + "/copy.mp4";

void makeMovie(const std::string& path) {
    std::filesystem::remove(path);
    RawWriter movie(path);
    movie.append(__builtin_bswap32(1'000'000));
    movie.appendBytes("mdat", 4);
    const std::vector<char> media(999'992, 'm');
    movie.appendBytes(media.data(), media.size());
}

std::uint64_t sizeOf(const std::string& path) {
    return std::filesystem::file_size(path);
}

void compareAppends() {
    const uuid types[] = {s_cursorLocationUUID, s_scrollActionUUID, s_caretPositionUUID, s_deviceFrameCoordinatesUUID,
                          s_miscellanyUUID};
    std::vector<std::string> files;
    std::string names;
    for (const uuid& type : types) {
        files.push_back(scratchFolder() + "/stream" + std::to_string(files.size()));
        names += " " + files.back();
        MetaDataWriter<Point, int, int> writer;
        writer.init(files.back(), type, 1);
        for (int i = 0; i < 6'250'000; ++i)
            writer.write(i, Point(i, 0), false);
    }
    bool copied = false;
    const std::uint64_t headers = 16 + 5 * 16;
    compare({"append 5 streams of 100 MB", "cat >>", 1.10},
            {[&] { copied = std::system(("cat" + names + " >> " + s_copy).c_str()) == 0; }, [] { makeMovie(s_copy); }},
            {[&] { MP4MetaData::appendMetaDataFiles(s_movie, files); }, [] { makeMovie(s_movie); }}, 5,
            [&] { return copied && sizeOf(s_movie) == sizeOf(s_copy) + headers; });
}

/// A stream of variable-size entries, mapped.
std::uint64_t walkMapped(const std::string& path) {
    const int file = open(path.c_str(), O_RDONLY);
    const std::uint64_t size = sizeOf(path);
    void* mapped = mmap(nullptr, size, PROT_READ, MAP_PRIVATE, file, 0);
    const char* bytes = static_cast<const char*>(mapped);
    std::uint64_t position = 24;
    while (position + 4 <= size)
        position += 4 + valueAt<std::uint32_t>(bytes + position);
    munmap(mapped, size);
    close(file);
    return position;
}

/// The walk alone: what appending takes longer than copying the same bytes.
void compareWalks() {
    const Measure measure{"walk 5 million small entries before they are appended",
                          "the same walk in a mapped file; copying taken off", 3};
    if (!isSelected(measure))
        return;
    bool copied = false;
    const std::string stream = scratchFolder() + "/texts.dat";
    {
        MetaDataWriter<std::string, int, int> writer;
        writer.init(stream, s_slideTextUUID, 1);
        for (int i = 0; i < 5'000'000; ++i)
            writer.write(i, "abcdefgh", false);
    }
    std::uint64_t end = 0;
    const auto cat = [&] { copied = std::system(("cat " + stream + " >> " + s_copy).c_str()) == 0; };
    const auto append = [&] { MP4MetaData::appendMetaDataFiles(s_movie, {stream}); };
    const Timing copying = timeSideBySide({cat, [] { makeMovie(s_copy); }}, {append, [] { makeMovie(s_movie); }}, 1);
    const Timing walking = timeSideBySide({[&] { end = walkMapped(stream); }}, {[] {}}, 1);
    if (end != sizeOf(stream) || !copied || sizeOf(s_movie) != sizeOf(s_copy) + 32)
        return reportWrong(measure);
    reportFigure(measure, (copying.library - copying.baseline) / walking.baseline, "x");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        compareAppends();
        compareWalks();
    });
}
