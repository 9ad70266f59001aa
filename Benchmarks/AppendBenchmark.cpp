// Appending entries to a stream, as a recorder does.

#include "Benchmarks/Baseline.h"
#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr std::size_t s_headerSize = 24;

std::string contentsOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

const std::string s_raw = scratchFolder() + "/raw.dat";
const std::string s_stream = scratchFolder() + "/stream.dat";

bool sameBytes() {
    return contentsOf(s_stream).substr(s_headerSize) == contentsOf(s_raw);
}

/// `appendRaw(writer, i)` appends the bytes of the value that `valueOf(i)` gives.
template <class T, class ValueOf, class AppendRaw>
void compareAppends(const Measure& measure, const uuid& type, int version, int entries, bool flush, ValueOf valueOf,
                    AppendRaw appendRaw) {
    const auto baseline = [&] {
        RawWriter writer(s_raw);
        for (int i = 0; i < entries; ++i) {
            appendRaw(writer, i);
            if (flush)
                writer.flush();
        }
    };
    const auto library = [&] {
        MetaDataWriter<T, int, int> writer;
        writer.init(s_stream, type, version);
        for (int i = 0; i < entries; ++i)
            writer.write(i, valueOf(i), flush);
        writer.close();
    };
    compare(measure, {baseline}, {library}, entries, sameBytes);
}

template <class T, class ValueOf>
void compareFixedSizeAppends(const std::string& name, const uuid& type, ValueOf valueOf) {
    compareAppends<T>({"append one " + name + " entry, no flush", "memcpy and write(2) of 1 MiB", 1.5}, type, 1,
                      5'000'000, false, valueOf,
                      [&](RawWriter& writer, int i) { writer.append(double(i), valueOf(i)); });
}

void compareFixedSizeAppends() {
    compareFixedSizeAppends<Point>("Point", s_cursorLocationUUID, [](int i) { return Point(i, -i); });
    compareFixedSizeAppends<Rect>("Rect", s_hoverRectUUID, [](int i) { return Rect(i, -i, 7, 9); });
    compareFixedSizeAppends<KeyStroke>("KeyStroke", s_keyboardActionUUID,
                                       [](int i) { return KeyStroke(static_cast<std::uint32_t>(i), 0); });
    compareFixedSizeAppends<int>("int", s_cursorActionUUID, [](int i) { return i; });
    compareFixedSizeAppends<float>("float", s_cpuUsageUUID, [](int i) { return float(i); });
    compareFixedSizeAppends<double>("double", s_cursorOpacityUUID, [](int i) { return double(i); });
}

void compareFlushedAppends() {
    compareAppends<Point>(
        {"append a Point entry and flush", "write(2) an entry", 1.15}, s_cursorLocationUUID, 1, 200'000, true,
        [](int i) { return Point(i, 0); }, [](RawWriter& writer, int i) { writer.append(double(i), Point(i, 0)); });
}

void compareStringAppends() {
    const std::string text(40, 'x');
    compareAppends<std::string>(
        {"append a string of 40 bytes", "the same bytes, memcpy and write(2)", 2}, s_slideTextUUID, 1, 1'000'000, false,
        [&](int) -> const std::string& { return text; },
        [&](RawWriter& writer, int i) {
            writer.append(std::uint32_t{48}, double(i));
            writer.appendBytes(text.data(), text.size());
        });
}

void compareCursorAppends() {
    std::vector<unsigned char> picture(4096, 7);
    CursorImage cursor(1, 2, 3, picture.data(), 4096, CursorTypeUnknown, CursorImage::DefaultFlags);
    compareAppends<CursorImage>(
        {"append a cursor image of 4 KiB", "the same bytes, memcpy and write(2)", 1.3}, s_cursorImageUUID, 2, 50'000,
        false, [&](int) -> const CursorImage& { return cursor; },
        [&](RawWriter& writer, int i) {
            writer.append(std::uint32_t{4136}, double(i), cursor.uniqueId, std::uint32_t{4116}, std::uint32_t{4096},
                          cursor.hotspotOffsetX, cursor.hotspotOffsetY);
            writer.appendBytes(reinterpret_cast<const char*>(picture.data()), picture.size());
            writer.append(cursor.cursorTypeId, cursor.flags);
        });
    cursor.freeImageData(false);
}

void compareExistingCursorAppends() {
    CursorImage cursor;
    cursor.uniqueId = 7;
    compareAppends<CursorImage>(
        {"append a cursor that was seen before", "the same bytes, memcpy and write(2)", 2.5}, s_cursorImageUUID, 2,
        1'000'000, false, [&](int) -> const CursorImage& { return cursor; },
        [&](RawWriter& writer, int i) {
            writer.append(std::uint32_t{28}, double(i), cursor.uniqueId, std::uint32_t{8}, std::uint32_t{0},
                          std::uint32_t{3});
        });
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        compareFixedSizeAppends();
        compareFlushedAppends();
        compareStringAppends();
        compareCursorAppends();
        compareExistingCursorAppends();
    });
}
