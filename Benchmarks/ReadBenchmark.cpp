// Giving the entries of a stream to an observer, as a parser does.

#include "Benchmarks/Baseline.h"
#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <filesystem>
#include <fstream>
#include <sstream>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr std::size_t s_headerSize = 24;
const std::string s_stream = scratchFolder() + "/stream.dat";

template <class T, class ValueOf>
void writeStream(const uuid& type, int version, int entries, ValueOf valueOf) {
    MetaDataWriter<T, int, int> writer;
    writer.init(s_stream, type, version);
    for (int i = 0; i < entries; ++i)
        writer.write(i, valueOf(i), false);
    writer.close();
}

std::uint64_t digest(const Point& value) {
    return static_cast<std::uint64_t>(value.x) * 31 + static_cast<std::uint64_t>(value.y);
}
std::uint64_t digest(const std::string& value) {
    return value.size() * 31 + static_cast<unsigned char>(value.back());
}
std::uint64_t digest(const CursorImage& value) {
    return value.imageDataSize * 31ULL + value.imageData[value.imageDataSize - 1];
}

/// Adds up what it sees, so that both ways can be compared.
template <class T>
struct Sum final : DataStreamObserver<T> {
    std::uint64_t values = 0;
    double times = 0;

    bool dataRead(double time, const T& value) override {
        times += time;
        values += digest(value);
        return true;
    }
    friend bool operator==(const Sum& left, const Sum& right) {
        return left.values == right.values && left.times == right.times;
    }
};

/// `readEntry(bytes, size, observer)` takes one entry and gives its size, or 0 where it is not all there. The
/// observer is called virtually, as it is in the library.
template <class T, class ReadEntry>
[[gnu::noinline]] void readRaw(DataStreamObserver<T>& observer, ReadEntry readEntry) {
    readBlocks(s_stream, s_headerSize, [&](const char* bytes, std::size_t size) {
        std::size_t taken = 0;
        while (const std::size_t entry = readEntry(bytes + taken, size - taken, observer))
            taken += entry;
        return taken;
    });
}

template <class T, class ReadEntry>
void compareReads(const Measure& measure, const uuid& type, int version, int entries, ReadEntry readEntry) {
    Sum<T> raw;
    Sum<T> ours;
    compare(measure, {[&] { readRaw<T>(raw, readEntry); }},
            {[&] { MetaDataParser::create(s_stream)->loadDataType<T>(type, ours, version); }}, entries,
            [&] { return raw == ours; });
}

std::size_t readPoint(const char* bytes, std::size_t size, DataStreamObserver<Point>& observer) {
    if (size < 16)
        return 0;
    observer.dataRead(valueAt<double>(bytes), valueAt<Point>(bytes + 8));
    return 16;
}

void comparePointReads() {
    constexpr int entries = 5'000'000;
    writeStream<Point>(s_cursorLocationUUID, 1, entries, [](int i) { return Point(i, -i); });
    compareReads<Point>({"read Point entries from a file", "read(2) of 1 MiB, the same virtual call", 1.8},
                        s_cursorLocationUUID, 1, entries, readPoint);

    std::stringstream stream;
    stream << std::ifstream(s_stream, std::ios::binary).rdbuf();
    Sum<Point> raw;
    Sum<Point> ours;
    compare({"read Point entries from a string stream", "read(2) of 1 MiB, the same virtual call", 1.5},
            {[&] { readRaw<Point>(raw, readPoint); }},
            {[&] { MetaDataReader<Point>::parseStream(ours, stream, 0, s_headerSize + 16ULL * entries, 1); },
             [&] {
                 stream.clear();
                 stream.seekg(0);
             }},
            entries, [&] { return raw == ours; });
}

void compareStringReads() {
    constexpr int entries = 1'000'000;
    const std::string text(40, 'x');
    writeStream<std::string>(s_slideTextUUID, 1, entries, [&](int) -> const std::string& { return text; });
    std::string value;
    compareReads<std::string>({"read strings of 40 bytes", "read(2), memcpy into a string", 2}, s_slideTextUUID, 1,
                              entries,
                              [&](const char* bytes, std::size_t size, DataStreamObserver<std::string>& observer) {
                                  if (size < 52)
                                      return std::size_t{0};
                                  const std::size_t entry = valueAt<std::uint32_t>(bytes);
                                  value.assign(bytes + 12, entry - 8);
                                  observer.dataRead(valueAt<double>(bytes + 4), value);
                                  return entry + 4;
                              });
}

void compareCursorReads() {
    constexpr int entries = 50'000;
    constexpr std::size_t entrySize = 4140;
    std::vector<unsigned char> picture(4096, 7);
    CursorImage cursor(1, 2, 3, picture.data(), 4096, CursorTypeUnknown, CursorImage::DefaultFlags);
    writeStream<CursorImage>(s_cursorImageUUID, 2, entries, [&](int) -> const CursorImage& { return cursor; });
    compareReads<CursorImage>({"read cursor images of 4 KiB", "read(2), memcpy into a buffer of its own", 1.5},
                              s_cursorImageUUID, 2, entries,
                              [&](const char* bytes, std::size_t size, DataStreamObserver<CursorImage>& observer) {
                                  if (size < entrySize)
                                      return std::size_t{0};
                                  auto* image = static_cast<unsigned char*>(std::malloc(4096));
                                  std::memcpy(image, bytes + 36, 4096);
                                  const CursorImage value(valueAt<std::uint64_t>(bytes + 12), 0, 0, image, 4096,
                                                          CursorTypeUnknown, CursorImage::DefaultFlags);
                                  observer.dataRead(valueAt<double>(bytes + 4), value);
                                  return entrySize;
                              });
    cursor.freeImageData(false);
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        comparePointReads();
        compareStringReads();
        compareCursorReads();
    });
}
