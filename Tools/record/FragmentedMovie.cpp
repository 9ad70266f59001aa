#include "Tools/record/FragmentedMovie.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <limits>
#include <optional>
#include <utility>

namespace Recorder {

namespace {

constexpr std::uint64_t s_shortHeader = 8; ///< of an atom whose size has 32 bits
constexpr std::uint32_t s_moov = boxType("moov");
constexpr std::uint32_t s_moof = boxType("moof");
constexpr std::uint32_t s_free = boxType("free");
constexpr std::uint64_t s_largestIndex = std::uint64_t{64} << 20;
constexpr std::uint64_t s_longestMovie = 1'000'000'000; ///< seconds, so that no product of times overflows
constexpr std::uint32_t s_longestRun = 1 << 16;         ///< samples whose sizes are not listed one by one
constexpr std::uint32_t s_primingOfAAC = 1024;          ///< samples that the encoder puts before the sound

// What the head of a track's fragment (tfhd) says.
constexpr std::uint32_t s_headHasBase = 0x1;
constexpr std::uint32_t s_headHasDescription = 0x2;
constexpr std::uint32_t s_headHasDuration = 0x8;
constexpr std::uint32_t s_headHasSize = 0x10;
constexpr std::uint32_t s_headHasFlags = 0x20;

// What a run of samples (trun) says.
constexpr std::uint32_t s_hasOffset = 0x1;
constexpr std::uint32_t s_hasFirstFlags = 0x4;
constexpr std::uint32_t s_hasDurations = 0x100;
constexpr std::uint32_t s_hasSizes = 0x200;
constexpr std::uint32_t s_hasFlags = 0x400;
constexpr std::uint32_t s_hasShowingTimes = 0x800;
constexpr std::uint32_t s_isNotSync = 0x10000; ///< a flag of a sample

template <class Items>
std::uint32_t countOf(const Items& items) {
    return static_cast<std::uint32_t>(items.size());
}

bool readAt(int file, std::uint64_t offset, std::span<std::uint8_t> bytes) {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const ssize_t count = pread(file, bytes.data() + done, bytes.size() - done, static_cast<off_t>(offset + done));
        if (count <= 0)
            return false;
        done += static_cast<std::size_t>(count);
    }
    return true;
}

bool writeAt(int file, std::uint64_t offset, std::span<const std::uint8_t> bytes) {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const ssize_t count = pwrite(file, bytes.data() + done, bytes.size() - done, static_cast<off_t>(offset + done));
        if (count < 0)
            return false;
        done += static_cast<std::size_t>(count);
    }
    return true;
}

/// An atom of the file, which is not in memory.
struct FileBox {
    std::uint64_t offset = 0;
    std::uint64_t size = 0;
    std::uint64_t headerSize = s_shortHeader;
    std::uint32_t type = 0;
};

/// Returns the atom at `offset` if it is whole.
std::optional<FileBox> boxAt(int file, std::uint64_t offset, std::uint64_t end) {
    std::array<std::uint8_t, 16> header{};
    if (end - offset < 8 || !readAt(file, offset, std::span(header).first(8)))
        return std::nullopt;
    BoxReader reader(header);
    FileBox box{offset, reader.u32(), s_shortHeader, reader.u32()};
    if (box.size == 1) {
        if (end - offset < 16 || !readAt(file, offset, header))
            return std::nullopt;
        box.size = reader.isWhole() ? BoxReader(std::span(header).subspan(8)).u64() : 0;
        box.headerSize = 16;
    }
    if (box.size < box.headerSize || box.size > end - offset)
        return std::nullopt;
    return box;
}

/// The first atom in an index shows that it is one, also after it became free space.
std::uint32_t typeOf(const FileBox& box, const Bytes& bytes) {
    if (box.type != s_moov && box.type != s_moof && box.type != s_free)
        return box.type;
    constexpr std::size_t innerType = 12;
    const std::uint32_t first = bytes.size() < 16 ? 0 : BoxReader(std::span(bytes).subspan(innerType)).u32();
    return first == boxType("mvhd") ? s_moov : first == boxType("mfhd") ? s_moof : s_free;
}

/// Returns the number after the times of creation and change, with which three kinds of headers begin.
std::uint32_t afterTimes(const Box& header) {
    BoxReader reader(header.payload);
    const bool isWide = reader.u32() >> 24 == 1;
    reader.skip(isWide ? 16 : 8);
    return reader.u32();
}

/// Returns the header with another duration, which comes `gap` bytes after the times.
Bytes withDuration(const Box& header, std::size_t gap, std::uint64_t duration) {
    Bytes box(header.whole.begin(), header.whole.end());
    const bool isWide = box.size() > 8 && box[8] == 1;
    const std::size_t place = (isWide ? 28U : 20U) + gap;
    const std::size_t size = isWide ? 8 : 4;
    if (!isWide)
        duration = std::min<std::uint64_t>(duration, std::numeric_limits<std::uint32_t>::max());
    for (std::size_t i = 0; i < size && place + i < box.size(); ++i)
        box[place + i] = static_cast<std::uint8_t>(duration >> (8 * (size - 1 - i)));
    return box;
}

} // namespace

FragmentedMovie::FragmentedMovie(int file, const std::string& name) : name_(name) {
    struct stat status {};
    if (fstat(file, &status) != 0)
        throw Failure(fmt::format("{}: cannot be read: {}", name_, std::strerror(errno)));
    fileBytes_ = static_cast<std::uint64_t>(status.st_size);
    std::optional<Bytes> fragment; // whose pictures follow
    std::uint64_t fragmentOffset = 0;
    std::uint64_t next = 0;
    while (const auto box = boxAt(file, next, fileBytes_)) {
        const std::uint64_t offset = std::exchange(next, next + box->size);
        Bytes bytes;
        if (box->type == s_moov || box->type == s_moof || box->type == s_free) {
            if (box->size > s_largestIndex || box->headerSize != s_shortHeader)
                break; // the recorder writes neither
            bytes.resize(static_cast<std::size_t>(box->size));
            if (!readAt(file, offset, bytes))
                break;
        }
        const std::uint32_t type = typeOf(*box, bytes);
        if (type == s_moov && movie_.empty()) {
            readMovieBox(std::move(bytes));
            hidden_.push_back(offset);
            wholeBytes_ = offset + box->size;
        } else if (type == s_moof && !movie_.empty()) {
            fragment = std::move(bytes);
            fragmentOffset = offset;
        } else if (type == boxType("mdat") && fragment) {
            if (!readFragment(*fragment, fragmentOffset, {offset + box->headerSize, next}))
                break;
            hidden_.push_back(fragmentOffset);
            fragment.reset();
            wholeBytes_ = next;
        }
    }
    if (movie_.empty() || tracks_.empty())
        throw Failure(fmt::format("{}: the movie has no beginning", name_));
}

void FragmentedMovie::readMovieBox(Bytes movie) {
    movie_ = std::move(movie);
    const Box box = boxesIn(movie_).front();
    for (const Box& child : boxesIn(box.payload)) {
        if (child.type == boxType("mvhd")) {
            timescale_ = std::max(1U, afterTimes(child));
        } else if (child.type == boxType("trak")) {
            Track track;
            track.id = afterTimes(childOf(child, boxType("tkhd")));
            const Box media = childOf(child, boxType("mdia"));
            track.timescale = std::max(1U, afterTimes(childOf(media, boxType("mdhd"))));
            BoxReader handler(childOf(media, boxType("hdlr")).payload);
            handler.skip(8);
            track.isVideo = handler.u32() == boxType("vide");
            tracks_.push_back(std::move(track));
        }
    }
    for (const Box& extension : boxesIn(childOf(box, boxType("mvex")).payload)) {
        BoxReader reader(extension.payload);
        reader.skip(4);
        Track* track = extension.type == boxType("trex") ? trackOf(reader.u32()) : nullptr;
        if (!track)
            continue;
        reader.skip(4);
        track->defaultDuration = reader.u32();
        track->defaultSize = reader.u32();
        track->defaultFlags = reader.u32();
    }
}

/// Takes nothing of a fragment whose samples are not all in its media.
bool FragmentedMovie::readFragment(const Bytes& fragment, std::uint64_t offset, const Media& media) {
    std::vector<SampleRun> runs;
    for (const Box& box : boxesIn(std::span(fragment).subspan(s_shortHeader)))
        if (box.type == boxType("traf") && !readTrackFragment(box, offset, media, runs))
            return false;
    std::uint64_t left = media.end - media.begin;
    for (const SampleRun& run : runs) {
        if (run.bytes > left)
            return false;
        left -= run.bytes;
    }
    for (SampleRun& run : runs) {
        std::vector<Sample>& samples = run.track->samples;
        samples.insert(samples.end(), run.samples.begin(), run.samples.end());
        if (run.chunk.samples > 0)
            run.track->chunks.push_back(run.chunk);
    }
    return true;
}

/// Returns false if the atom is damaged.
bool FragmentedMovie::readTrackFragment(const Box& box, std::uint64_t fragmentOffset, const Media& media,
                                        std::vector<SampleRun>& runs) {
    BoxReader header(childOf(box, boxType("tfhd")).payload);
    const std::uint32_t flags = header.u32();
    Track* track = trackOf(header.u32());
    if (!track || !header.isWhole())
        return false;
    const std::uint64_t base = (flags & s_headHasBase) != 0 ? header.u64() : fragmentOffset;
    if ((flags & s_headHasDescription) != 0)
        header.skip(4);
    Sample usual;
    usual.duration = (flags & s_headHasDuration) != 0 ? header.u32() : track->defaultDuration;
    usual.size = (flags & s_headHasSize) != 0 ? header.u32() : track->defaultSize;
    const std::uint32_t usualFlags = (flags & s_headHasFlags) != 0 ? header.u32() : track->defaultFlags;
    BoxReader start(childOf(box, boxType("tfdt")).payload);
    const bool isWide = start.u32() >> 24 == 1;
    usual.time = isWide ? start.u64() : start.u32();
    if (!header.isWhole() || !start.isWhole() || usual.time > s_longestMovie * track->timescale)
        return false;
    for (const Box& run : boxesIn(box.payload)) {
        if (run.type != boxType("trun"))
            continue;
        SampleRun& read = runs.emplace_back();
        read.track = track;
        if (!readRun(run, base, usualFlags, media, usual, read))
            return false;
    }
    return true;
}

/// `usual` is what the samples are unless the run says otherwise, and has the time of the next one.
bool FragmentedMovie::readRun(const Box& box, std::uint64_t base, std::uint32_t usualFlags, const Media& media,
                              Sample& usual, SampleRun& run) {
    BoxReader reader(box.payload);
    const std::uint32_t has = reader.u32();
    const std::uint32_t count = reader.u32();
    const std::int64_t distance = (has & s_hasOffset) != 0 ? reader.i32() : 0;
    if (base > media.end || static_cast<std::int64_t>(base) + distance < 0)
        return false;
    run.chunk.offset = static_cast<std::uint64_t>(static_cast<std::int64_t>(base) + distance);
    const std::uint32_t firstFlags = (has & s_hasFirstFlags) != 0 ? reader.u32() : usualFlags;
    const bool hasSizes = (has & s_hasSizes) != 0;
    if (run.chunk.offset < media.begin || run.chunk.offset > media.end || (!hasSizes && count > s_longestRun))
        return false;
    for (std::uint32_t i = 0; i < count; ++i) {
        Sample sample = usual;
        if ((has & s_hasDurations) != 0)
            sample.duration = reader.u32();
        if (hasSizes)
            sample.size = reader.u32();
        const std::uint32_t own = (has & s_hasFlags) != 0 ? reader.u32() : i == 0 ? firstFlags : usualFlags;
        if ((has & s_hasShowingTimes) != 0)
            reader.skip(4); // pictures are shown in the order in which they are decoded
        sample.isSync = (own & s_isNotSync) == 0;
        run.bytes += sample.size;
        if (!reader.isWhole() || sample.size == 0 || run.bytes > media.end - run.chunk.offset)
            return false;
        usual.time += sample.duration;
        if (usual.time > s_longestMovie * run.track->timescale)
            return false;
        run.samples.push_back(sample);
        ++run.chunk.samples;
    }
    return true;
}

FragmentedMovie::Track* FragmentedMovie::trackOf(std::uint32_t id) {
    const auto found =
        std::find_if(tracks_.begin(), tracks_.end(), [id](const Track& track) { return track.id == id; });
    return found == tracks_.end() ? nullptr : &*found;
}

std::uint64_t FragmentedMovie::frames() const {
    return tracks_.front().samples.size();
}

std::uint64_t FragmentedMovie::durationOf(const Track& track) const {
    return track.samples.empty() ? 0 : track.samples.back().time + track.samples.back().duration;
}

double FragmentedMovie::duration() const {
    return static_cast<double>(durationOf(tracks_.front())) / tracks_.front().timescale;
}

std::uint64_t FragmentedMovie::inMovieTime(const Track& track, std::uint64_t duration) const {
    return duration / track.timescale * timescale_ +
           (duration % track.timescale * timescale_ + track.timescale / 2) / track.timescale;
}

void FragmentedMovie::makeOrdinary(int file) const {
    if (frames() == 0)
        throw Failure(fmt::format("{}: no frame of the movie is whole", name_));
    Bytes index = ordinaryIndex();
    const auto failed = [this](const char* what) {
        return Failure(fmt::format("{}: {}: {}", name_, what, std::strerror(errno)), ExitLoss);
    };
    if (ftruncate(file, static_cast<off_t>(wholeBytes_)) != 0)
        throw failed("cannot be cut to its whole fragments");
    // The new index comes to the disk as free space first. Until its type is set, the fragments still have theirs, or
    // can be recognised by what is in them.
    constexpr std::size_t typeAt = 4;
    const auto setType = [&](std::uint64_t box, std::uint32_t type) {
        BoxWriter writer;
        writer.u32(type);
        if (!writeAt(file, box + typeAt, writer.result()))
            throw failed("cannot be written");
    };
    const std::uint32_t hiddenType = boxType("skip");
    for (std::size_t i = 0; i < 4; ++i)
        index[typeAt + i] = static_cast<std::uint8_t>(hiddenType >> (24 - 8 * i));
    if (!writeAt(file, wholeBytes_, index) || fsync(file) != 0)
        throw failed("the index cannot be written");
    for (const std::uint64_t box : hidden_)
        setType(box, s_free);
    setType(wholeBytes_, s_moov);
    if (fsync(file) != 0)
        throw failed("cannot be written");
}

Bytes FragmentedMovie::ordinaryIndex() const {
    BoxWriter writer;
    const Box movie = boxesIn(movie_).front();
    writer.box(s_moov, [&] {
        for (const Box& child : boxesIn(movie.payload)) {
            if (child.type == boxType("trak")) {
                writeTrack(writer, child);
            } else if (child.type == boxType("mvhd")) {
                std::uint64_t longest = 0;
                for (const Track& track : tracks_)
                    longest = std::max(longest, inMovieTime(track, durationOf(track)));
                writer.bytes(withDuration(child, 4, longest));
            } else if (child.type != boxType("mvex")) {
                writer.bytes(child.whole);
            }
        }
    });
    return writer.result();
}

void FragmentedMovie::writeTrack(BoxWriter& writer, const Box& box) const {
    const std::uint32_t id = afterTimes(childOf(box, boxType("tkhd")));
    const auto track =
        std::find_if(tracks_.begin(), tracks_.end(), [id](const Track& candidate) { return candidate.id == id; });
    if (track == tracks_.end() || track->samples.empty())
        return;
    const std::uint64_t duration = inMovieTime(*track, durationOf(*track));
    writer.box(boxType("trak"), [&] {
        for (const Box& child : boxesIn(box.payload)) {
            if (child.type == boxType("tkhd")) {
                writer.bytes(withDuration(child, 8, duration));
                if (!track->isVideo)
                    writer.box(boxType("edts"), [&] {
                        writer.fullBox(boxType("elst"), 1, 0, [&] {
                            writer.u32(1);
                            writer.u64(duration);
                            writer.u64(s_primingOfAAC);
                            writer.u32(0x10000);
                        });
                    });
            } else if (child.type == boxType("mdia")) {
                writeMedia(writer, child, *track);
            } else if (child.type != boxType("edts")) {
                writer.bytes(child.whole);
            }
        }
    });
}

void FragmentedMovie::writeMedia(BoxWriter& writer, const Box& box, const Track& track) const {
    writer.box(boxType("mdia"), [&] {
        for (const Box& child : boxesIn(box.payload)) {
            if (child.type == boxType("mdhd")) {
                writer.bytes(withDuration(child, 4, durationOf(track)));
            } else if (child.type == boxType("minf")) {
                writer.box(boxType("minf"), [&] {
                    for (const Box& part : boxesIn(child.payload)) {
                        if (part.type == boxType("stbl"))
                            writeTables(writer, part, track);
                        else
                            writer.bytes(part.whole);
                    }
                });
            } else {
                writer.bytes(child.whole);
            }
        }
    });
}

void FragmentedMovie::writeTables(BoxWriter& writer, const Box& box, const Track& track) {
    writer.box(boxType("stbl"), [&] {
        writer.bytes(childOf(box, boxType("stsd")).whole);
        writeDurations(writer, track);
        writeSyncSamples(writer, track);
        writeChunkSizes(writer, track);
        writer.fullBox(boxType("stsz"), 0, 0, [&] {
            writer.u32(0);
            writer.u32(countOf(track.samples));
            for (const Sample& sample : track.samples)
                writer.u32(sample.size);
        });
        writer.fullBox(boxType("co64"), 0, 0, [&] {
            writer.u32(countOf(track.chunks));
            for (const Chunk& chunk : track.chunks)
                writer.u64(chunk.offset);
        });
    });
}

/// A sample lasts until the next one.
void FragmentedMovie::writeDurations(BoxWriter& writer, const Track& track) {
    struct Row {
        std::uint32_t samples;
        std::uint32_t duration;
    };
    const auto& samples = track.samples;
    std::vector<Row> rows;
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const bool hasNext = i + 1 < samples.size() && samples[i + 1].time >= samples[i].time;
        const std::uint64_t length =
            hasNext ? samples[i + 1].time - samples[i].time : std::uint64_t{samples[i].duration};
        const auto duration = static_cast<std::uint32_t>(std::min<std::uint64_t>(length, 0xffffffff));
        if (rows.empty() || rows.back().duration != duration)
            rows.push_back({0, duration});
        ++rows.back().samples;
    }
    writer.fullBox(boxType("stts"), 0, 0, [&] {
        writer.u32(countOf(rows));
        for (const Row& row : rows) {
            writer.u32(row.samples);
            writer.u32(row.duration);
        }
    });
}

/// Without this table every sample can be decoded by itself.
void FragmentedMovie::writeSyncSamples(BoxWriter& writer, const Track& track) {
    std::vector<std::uint32_t> numbers;
    for (std::size_t i = 0; i < track.samples.size(); ++i)
        if (track.samples[i].isSync)
            numbers.push_back(static_cast<std::uint32_t>(i + 1));
    if (numbers.size() == track.samples.size())
        return;
    writer.fullBox(boxType("stss"), 0, 0, [&] {
        writer.u32(countOf(numbers));
        for (const std::uint32_t number : numbers)
            writer.u32(number);
    });
}

void FragmentedMovie::writeChunkSizes(BoxWriter& writer, const Track& track) {
    struct Row {
        std::uint32_t firstChunk;
        std::uint32_t samples; ///< in this chunk and those up to the next row
    };
    std::vector<Row> rows;
    for (std::size_t i = 0; i < track.chunks.size(); ++i)
        if (rows.empty() || rows.back().samples != track.chunks[i].samples)
            rows.push_back({static_cast<std::uint32_t>(i + 1), track.chunks[i].samples});
    constexpr std::uint32_t onlyDescription = 1;
    writer.fullBox(boxType("stsc"), 0, 0, [&] {
        writer.u32(countOf(rows));
        for (const Row& row : rows) {
            writer.u32(row.firstChunk);
            writer.u32(row.samples);
            writer.u32(onlyDescription);
        }
    });
}

} // namespace Recorder
