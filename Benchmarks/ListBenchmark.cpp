// Building an editor's list of entries.

#include "Benchmarks/Runner.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fstream>
#include <malloc.h>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr int s_entries = 1'000'000;
const std::string s_movie = scratchFolder() + "/movie.mp4";

/// All kinds that have texts or points, so that the wanted stream lies among others.
void makeMovie() {
    std::ofstream(s_movie, std::ios::binary) << std::string("\0\0\0\x08mdat", 8);
    std::vector<FileLocation> files;
    RecordedKinds::forEach([&]<class Kind>() {
        files.push_back(scratchFolder() + "/stream" + std::to_string(files.size()));
        MetaDataWriter<typename Kind::Value, int, int> writer;
        writer.init(files.back().string(), Kind::type, Kind::version);
        const bool isLocations = Kind::type == s_cursorLocationUUID;
        for (int i = 0; i < (isLocations ? s_entries : 100); ++i) {
            if constexpr (std::is_same_v<typename Kind::Value, Point>)
                writer.write(i, Point(i, -i), false);
            else
                writer.write(i, typename Kind::Value{}, false);
        }
    });
    ZULMAtomWriter().writeMetaDataFiles(files, s_movie);
}

/// Decoding alone, in the way that the parser decodes.
std::size_t decode() {
    MetaDataObserver<Point> observer;
    CursorLocationMetaDataParser parser(s_movie);
    const auto bytes = parser.getMetaDataStream(s_cursorLocationUUID);
    MetaDataParser::create(*bytes, Container::RawStream)->loadDataType(s_cursorLocationUUID, observer, 1);
    return observer.values.size();
}

std::shared_ptr<EntryList> s_list;

void reportList(const std::string& memory, double target) {
    const Measure measure{"list 1 million locations, " + memory, "decoding them into a vector", target};
    if (!isSelected(measure))
        return;
    std::size_t decoded = 0;
    const Timing timing = timeSideBySide(
        {[&] { decoded = decode(); }},
        {[] { s_list = CursorLocationMetaDataParser(s_movie).read(); }, [] { s_list.reset(); }}, s_entries);
    const EntryDictionary& last = s_list->back();
    if (decoded != s_entries || s_list->size() != s_entries || last.get<std::int32_t>("y") != 1 - s_entries)
        return reportWrong(measure);
    s_list.reset();
    reportFigure(measure, timing.library - timing.baseline, "ns an entry more");
}

void reportLists() {
    makeMovie();
    reportList("cold memory", 60);
    mallopt(M_MMAP_THRESHOLD, 1 << 30); // what was freed is given again, pages and all
    mallopt(M_TRIM_THRESHOLD, 1 << 30);
    reportList("warm memory", 15);
    reportFigure({"memory of a listed entry", "-", 104}, sizeof(EntryDictionary), "bytes");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, reportLists);
}
