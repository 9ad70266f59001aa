// Opening a movie: finding its metadata by walking its atoms.

#include "Benchmarks/Baseline.h"
#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <array>
#include <bit>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

const std::string s_movie = scratchFolder() + "/movie.mp4";

std::uint32_t bigEndian(std::uint32_t value) {
    return __builtin_bswap32(value);
}

/// Puts atoms into a sparse file, one behind the other, without writing their payload.
class MovieMaker {
public:
    explicit MovieMaker(const std::string& path) : file_(open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644)) {}
    MovieMaker(const MovieMaker&) = delete;
    MovieMaker& operator=(const MovieMaker&) = delete;
    ~MovieMaker() {
        isWhole_ = ftruncate(file_, position_) == 0 && isWhole_;
        close(file_);
    }

    void atom(const char* type, std::uint32_t size) {
        std::array<char, 8> header;
        const std::uint32_t stored = bigEndian(size);
        std::memcpy(header.data(), &stored, 4);
        std::memcpy(header.data() + 4, type, 4);
        put(header.data(), header.size());
        position_ += size - 8;
    }

    /// A ZULM with one stream of no entries, in extended form as it is always written.
    void metaData() {
        const std::uint64_t sizes[] = {__builtin_bswap64(56), __builtin_bswap64(40)};
        const std::uint32_t one = bigEndian(1);
        put(&one, 4), put("ZULM", 4), put(&sizes[0], 8);
        put(&one, 4), put("DATA", 4), put(&sizes[1], 8);
        const std::int32_t versionAndSize[] = {1, 16};
        put(&s_cursorLocationUUID, 16), put(versionAndSize, 8);
    }

private:
    void put(const void* bytes, std::size_t size) {
        isWhole_ = pwrite(file_, bytes, size, position_) == static_cast<ssize_t>(size) && isWhole_;
        position_ += static_cast<off_t>(size);
    }

    int file_;
    off_t position_ = 0;
    bool isWhole_ = true;
};

/// 16 bytes of every top-level atom, and nothing else. Gives where the last atom begins.
std::uint64_t walkRaw() {
    const int file = open(s_movie.c_str(), O_RDONLY);
    std::array<char, 16> header;
    std::uint64_t position = 0;
    std::uint64_t last = 0;
    while (pread(file, header.data(), header.size(), static_cast<off_t>(position)) == 16) {
        last = position;
        const std::uint32_t size = bigEndian(valueAt<std::uint32_t>(header.data()));
        position += size == 1 ? __builtin_bswap64(valueAt<std::uint64_t>(header.data() + 8)) : size;
    }
    close(file);
    return last;
}

void compareScans(const Measure& measure, int atoms, int times) {
    std::uint64_t raw = 0;
    std::uint64_t ours = 0;
    compare(measure, {[&] {
                for (int i = 0; i < times; ++i)
                    raw = walkRaw() + 32;
            }},
            {[&] {
                for (int i = 0; i < times; ++i)
                    ours = MetaDataParser::create(s_movie)->fileDataForUUID(s_cursorLocationUUID).offset;
            }},
            double(atoms) * times, [&] { return raw == ours; });
}

void compareNearAtoms() {
    {
        MovieMaker movie(s_movie);
        for (int i = 0; i < 100'000; ++i)
            movie.atom("moof", 100), movie.atom("mdat", 120);
        movie.metaData();
    }
    compareScans({"open a movie of 200,000 atoms near each other", "pread(2) of 16 bytes an atom", 0.6}, 200'001, 1);
}

void compareSparseAtoms() {
    {
        MovieMaker movie(s_movie);
        for (int i = 0; i < 100'000; ++i)
            movie.atom("moof", 1'000), movie.atom("mdat", 278'000);
        movie.metaData();
    }
    compareScans({"open a movie of 26 GiB, 200,000 atoms far apart", "pread(2) of 16 bytes an atom", 1.0}, 200'001, 1);
}

void compareOrdinaryMovies() {
    {
        MovieMaker movie(s_movie);
        movie.atom("ftyp", 32), movie.atom("free", 8), movie.atom("mdat", 500'000'000), movie.atom("moov", 300'000);
        movie.metaData();
    }
    compareScans({"open an ordinary movie", "open(2), pread(2) of 16 bytes an atom", 1.15}, 5, 1000);
}

bool succeeds(const std::string& command) {
    return std::system((command + " > " + scratchFolder() + "/out 2>&1").c_str()) == 0;
}

/// Whole processes, on a movie that another program fragmented.
void comparePrograms() {
    const Measure mediainfo{"zulm info of 100,000 fragments", "mediainfo", 1 / 2.5};
    const Measure ffprobe{"zulm info of 100,000 fragments", "ffprobe", 1 / 8.0};
    if (!isSelected(mediainfo))
        return;
    if (!succeeds("ffmpeg -v error -y -f lavfi -i color=size=16x16:rate=1000 -t 100 -c:v mpeg4 -movflags "
                  "frag_every_frame+empty_moov " +
                  s_movie) ||
        !succeeds(std::string(ZULM_PATH " stamp --creator bench --creator-version 1 --in-place ") + s_movie))
        return reportWrong(mediainfo);
    bool allRan = true;
    const auto run = [&](const std::string& command) { return [&, command] { allRan = succeeds(command) && allRan; }; };
    const auto zulm = [&] {
        allRan =
            std::system(
                (std::string(ZULM_PATH " info --quiet ") + s_movie + " > " + scratchFolder() + "/out 2>&1").c_str()) ==
                4 << 8 &&
            allRan; // readable, without streams
    };
    compare(mediainfo, {run("mediainfo " + s_movie)}, {zulm}, 1, [&] { return allRan; });
    compare(ffprobe, {run("ffprobe " + s_movie)}, {zulm}, 1, [&] { return allRan; });
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] {
        compareNearAtoms();
        compareSparseAtoms();
        compareOrdinaryMovies();
        comparePrograms();
    });
}
