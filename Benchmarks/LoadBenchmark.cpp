// What a recorder pays for the recording, and how the cost grows.

#include "Benchmarks/Runner.h"
#include "Tools/demo/Cursors.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fmt/core.h>
#include <functional>

#include <cmath>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>
#include <sys/resource.h>
#include <unistd.h>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

double processorSeconds() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    const auto seconds = [](const timeval& time) { return double(time.tv_sec) + double(time.tv_usec) / 1e6; };
    return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

double residentMiB() {
    std::ifstream file("/proc/self/statm");
    std::uint64_t total = 0;
    std::uint64_t resident = 0;
    file >> total >> resident;
    return double(resident) * double(sysconf(_SC_PAGESIZE)) / (1 << 20);
}

/// All 17 writers. What happens how often is that of a lively session, and more of the cursor.
class Recorder {
public:
    explicit Recorder(const std::string& folder)
        : cursorAction_(folder + "/1"), cursorImage_(folder + "/2"), cursorLocation_(folder + "/3"),
          cursorOpacity_(folder + "/4"), keyboard_(folder + "/5"), region_(folder + "/6"), window_(folder + "/7"),
          slideTitle_(folder + "/8"), slideText_(folder + "/9"), slideComment_(folder + "/10"), scale_(folder + "/11"),
          system_(folder + "/12"), scroll_(folder + "/13"), app_(folder + "/14"), title_(folder + "/15"),
          cpu_(folder + "/16"), hover_(folder + "/17") {
        region_.writeAndFinalize({0, 0, 1920, 1080});
        scale_.writeAndFinalize(2);
        system_.write();
    }

    /// A thousand times a second.
    void record(std::int64_t millisecond) {
        const MediaTime now(millisecond, 1000);
        const auto wave = static_cast<double>(millisecond % 1000);
        cursorLocation_.write(ScreenPoint(wave, wave / 2), now);
        if (millisecond % 16 == 0)
            hover_.write(ScreenRect(wave, wave, 80, 20), now);
        if (millisecond % 20 == 0)
            scroll_.write(ScreenPoint(0, wave), now);
        if (millisecond % 100 == 0)
            keyboard_.writeCharacterCode(65, 0, now);
        if (millisecond % 250 == 0)
            recordClick(millisecond, now);
        if (millisecond % 5000 == 0)
            recordWindow(millisecond, now);
    }

private:
    void recordClick(std::int64_t millisecond, const MediaTime& now) {
        cursorAction_.write(1, now);
        cpu_.write(0.25F, now);
        const Demo::Cursor& cursor = cursors_[static_cast<std::size_t>(millisecond / 250) % cursors_.size()];
        if (millisecond < 1000)
            cursorImage_.writeCursorImage(*cursor.image, cursor.uid, cursor.typeId, 3, cursor.hotSpot, now);
        else
            cursorImage_.writeCursorWithExistingUID(cursor.uid, now);
    }

    void recordWindow(std::int64_t millisecond, const MediaTime& now) {
        const std::string number = std::to_string(millisecond / 5000);
        window_.write(ScreenRect(10, 20, 800, 600), now);
        app_.write("Editor", now);
        title_.write(("Document " + number).c_str(), now);
        cursorOpacity_.write(1.0, now);
        slideTitle_.write(("Slide " + number).c_str(), now);
        slideText_.write("What stands on it, in a line or two", now);
        slideComment_.write("What the speaker says to it", now);
    }

    std::vector<Demo::Cursor> cursors_ = Demo::drawnCursors(2);
    CursorActionMetaDataWriter cursorAction_;
    CursorImageMetaDataWriter cursorImage_;
    CursorLocationMetaDataWriter cursorLocation_;
    CursorOpacityMetaDataWriter cursorOpacity_;
    KeyboardActionMetaDataWriter keyboard_;
    RecordingRegionMetaDataWriter region_;
    TopmostWindowMetaDataWriter window_;
    SlideInfoTitleMetaDataWriter slideTitle_;
    SlideInfoTextMetaDataWriter slideText_;
    SlideInfoCommentMetaDataWriter slideComment_;
    ScaleFactorMetaDataWriter scale_;
    SystemDataMetaDataWriter system_;
    ScrollActionMetaDataWriter scroll_;
    TopmostAppNameMetaDataWriter app_;
    TopmostWindowTitleMetaDataWriter title_;
    CPUUsageMetaDataWriter cpu_;
    HoverRectMetaDataWriter hover_;
};

void reportFullLoad() {
    const Measure processor{"a recorder's full load, 17 kinds, cursor at 1 kHz", "one core at real-time rate", 0.1};
    const Measure memory{"the same: memory from the first second to the end of 10 minutes", "-", 1};
    if (!isSelected(processor))
        return;
    constexpr std::int64_t milliseconds = 10 * 60 * 1000;
    const std::string folder = scratchFolder() + "/streams";
    std::filesystem::create_directory(folder);
    double atFirst = 0;
    const double started = processorSeconds();
    {
        Recorder recorder(folder);
        for (std::int64_t now = 0; now < milliseconds; ++now) {
            recorder.record(now);
            if (now == 1000)
                atFirst = residentMiB();
        }
    }
    const double percent = (processorSeconds() - started) / (double(milliseconds) / 1000) * 100;
    if (std::filesystem::file_size(folder + "/3") != 24 + 16 * milliseconds)
        return reportWrong(processor);
    reportFigure(processor, percent, "%");
    reportFigure(memory, residentMiB() - atFirst, "MiB");
}

double secondsOf(const std::function<void()>& work) {
    return timeSideBySide({work}, {[] {}}, 1e9).baseline;
}

/// The slope of a straight line through the logarithms.
double exponentOf(const std::vector<double>& sizes, const std::vector<double>& times) {
    double sumX = 0;
    double sumY = 0;
    double sumXX = 0;
    double sumXY = 0;
    for (std::size_t i = 0; i < sizes.size(); ++i) {
        const double x = std::log(sizes[i]);
        const double y = std::log(times[i]);
        sumX += x, sumY += y, sumXX += x * x, sumXY += x * y;
    }
    const auto count = double(sizes.size());
    return (count * sumXY - sumX * sumY) / (count * sumXX - sumX * sumX);
}

struct Counter final : DataStreamObserver<Point> {
    std::uint64_t count = 0;
    bool dataRead(double, const Point&) override {
        ++count;
        return true;
    }
};

void writeLocations(const std::string& path, double entries) {
    MetaDataWriter<Point, int, int> writer;
    writer.init(path, s_cursorLocationUUID, 1);
    for (int i = 0; i < entries; ++i)
        writer.write(i, Point(i, i), false);
}

void reportGrowthWithEntries() {
    const Measure writing{"growth of writing, 10^4 to 10^7 entries", "linear: exponent 1", 1.02};
    const Measure reading{"growth of reading, 10^4 to 10^7 entries", "linear: exponent 1", 1.02};
    if (!isSelected(writing))
        return;
    const std::string path = scratchFolder() + "/growth.dat";
    const std::vector<double> sizes{1e4, 1e5, 1e6, 1e7};
    std::vector<double> writes;
    std::vector<double> reads;
    for (const double size : sizes) {
        writes.push_back(secondsOf([&] { writeLocations(path, size); }));
        Counter counter;
        reads.push_back(
            secondsOf([&] { MetaDataParser::create(path)->loadDataType<Point>(s_cursorLocationUUID, counter, 1); }));
        if (counter.count != static_cast<std::uint64_t>(size) * 9)
            return reportWrong(reading);
    }
    reportFigure(writing, exponentOf(sizes, writes), "");
    reportFigure(reading, exponentOf(sizes, reads), "");
}

/// `streams` of the registered kinds, in a sparse movie of that size.
std::string makeMovie(std::size_t streams, std::uintmax_t size) {
    const std::string movie = scratchFolder() + "/growth.mp4";
    std::ofstream(movie, std::ios::binary) << std::string("\0\0\0\x01mdat", 8);
    std::fstream header(movie, std::ios::binary | std::ios::in | std::ios::out);
    header.seekp(8);
    for (int shift = 56; shift >= 0; shift -= 8)
        header.put(static_cast<char>(size >> shift));
    header.close();
    std::filesystem::resize_file(movie, size);
    std::vector<FileLocation> files;
    for (std::size_t i = 0; i < streams; ++i) {
        files.push_back(scratchFolder() + "/kind" + std::to_string(i));
        MetaDataWriter<Point, int, int> writer;
        writer.init(files.back().string(), s_metaDataKinds[i].type, 1);
        for (int entry = 0; entry < 1000; ++entry)
            writer.write(entry, Point(), false);
    }
    ZULMAtomWriter().writeMetaDataFiles(files, movie);
    return movie;
}

void reportGrowthWithMovies() {
    const Measure streams{"growth of opening, 1 to 23 streams", "linear: exponent 1", 1.02};
    const Measure bytes{"growth of opening, movies of 1 to 64 GiB", "none: exponent 0", 0.05};
    if (!isSelected(bytes))
        return;
    const auto timeOf = [](const std::string& movie) {
        return secondsOf([&] {
            for (int i = 0; i < 500; ++i)
                MetaDataParser::create(movie);
        });
    };
    const std::vector<double> counts{1, 10, 23};
    std::vector<double> times;
    for (const double count : counts)
        times.push_back(timeOf(makeMovie(static_cast<std::size_t>(count), 1 << 30)));
    reportFigure(streams, exponentOf(counts, times), "");
    const std::vector<double> gigabytes{1, 4, 16, 64};
    times.clear();
    for (const double count : gigabytes)
        times.push_back(timeOf(makeMovie(17, static_cast<std::uintmax_t>(count) << 30)));
    reportFigure(bytes, std::abs(exponentOf(gigabytes, times)), "");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        reportFullLoad();
        reportGrowthWithEntries();
        reportGrowthWithMovies();
    });
}
