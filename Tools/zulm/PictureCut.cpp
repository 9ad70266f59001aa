#include "Tools/zulm/PictureCut.h"

#include "Tools/zulm/ChildProcess.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <map>
#include <optional>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;

namespace {

std::string addressIn(const PictureCut& cut, const std::string& file) {
    return mediaAddress((std::filesystem::path(cut.folder) / file).string());
}

/// How far the frame after this one is, in seconds; nothing after the last one.
std::optional<Rational> distanceAfter(const PictureStream& pictures, std::size_t frame) {
    if (frame + 1 >= pictures.frames.size())
        return std::nullopt;
    return pictures.secondsOf(pictures.frames[frame + 1] - pictures.frames[frame]);
}

/// A time a little before a frame and after the one before it; nothing for the first one and after the last one. It is
/// nearer to this frame, because ffmpeg rounds it to units of the stream, which may be as long as a frame.
std::optional<Rational> timeBefore(const PictureStream& pictures, std::size_t frame) {
    if (frame == 0 || frame >= pictures.frames.size())
        return std::nullopt;
    return pictures.secondsOf(pictures.frames[frame]) - *distanceAfter(pictures, frame - 1) / 4;
}

// Encoding --------------------------------------------------------------------------------------------------------

/// Returns the least distance between two frames of a piece that is sped up. With it the piece shows no more frames in
/// a second than the source usually does.
double leastDistanceIn(const PictureStream& pictures) {
    constexpr double most = 1.0 / 60; // seconds
    constexpr double tolerance = 0.9; // distances are rounded
    std::vector<double> distances{most};
    for (std::size_t i = 1; i < pictures.frames.size(); ++i)
        distances.push_back(pictures.secondsOf(pictures.frames[i] - pictures.frames[i - 1]).nearest());
    const auto usual = distances.begin() + static_cast<std::ptrdiff_t>(distances.size() / 2);
    std::nth_element(distances.begin(), usual, distances.end());
    return tolerance * std::min(most, *usual);
}

class Encoder {
public:
    explicit Encoder(const PictureCut& cut) : cut_(cut), leastDistance_(leastDistanceIn(cut.pictures)) {
        cut.ffmpeg.requireEncoder("libx264");
    }

    /// What is repeated is encoded once.
    PictureFile encoded(const EditPiece& piece, const Rational& base) {
        const std::string filter = filterFor(piece);
        std::string& file = files_[filter];
        if (file.empty()) {
            file = fmt::format("{}.nut", files_.size());
            encode(piece, filter, file, base);
        }
        return {file, piece};
    }

private:
    /// The first frame of a piece, which is shown at its start, and the first one after it.
    std::pair<std::size_t, std::size_t> framesOf(const EditPiece& piece) const {
        const std::size_t first = cut_.pictures.shownAt(piece.start);
        return {first, std::max(first + 1, piece.isHeld() ? 0 : cut_.pictures.firstFrom(piece.end))};
    }

    /// The first frame is shown from the start on, also if that is before its time. The times of the new frames are
    /// counted in nanoseconds here, and rounded once by the encoder.
    std::string filterFor(const EditPiece& piece) const {
        const auto [first, end] = framesOf(piece);
        std::string filter = "settb=1/1000000000,";
        if (const auto start = timeBefore(cut_.pictures, first))
            filter += fmt::format("trim=start={},", secondsFor(*start));
        if (const auto stop = timeBefore(cut_.pictures, end))
            filter += fmt::format("trim=end={},", secondsFor(*stop));
        filter += fmt::format("setpts='if(N,round(max(0,(PTS*TB-{})/{})/TB),0)'", numberFor(piece.start),
                              numberFor(piece.speed));
        if (piece.speed > 1)
            filter += fmt::format(",select='isnan(prev_selected_t)+gte(t-prev_selected_t,{:.9f})'", leastDistance_);
        return filter;
    }

    /// Without B frames, frames are stored in the order in which they are shown, so that files can follow one another.
    void encode(const EditPiece& piece, const std::string& filter, const std::string& file, const Rational& base) {
        Words words = cut_.source.openedAt(timeBefore(cut_.pictures, framesOf(piece).first));
        const auto add = [&words](const Words& more) { words.insert(words.end(), more.begin(), more.end()); };
        add({"-map", fmt::format("0:{}", cut_.pictures.index), "-vf", filter});
        add({cut_.ffmpeg.frameRateOption(), "passthrough", "-enc_time_base", fmt::format("1:{}", s_ticksPerSecond)});
        add({"-c:v", "libx264", "-bf", "0", "-crf", "18"});
        add({"-progress", "pipe:1", "-f", "nut", addressIn(cut_, file)});
        cut_.ffmpeg.run(words,
                        fmt::format("cut the pictures of {} from {} s on", cut_.source.name, secondsFor(piece.start)),
                        inLines([&](std::string_view line) { noteProgress(line, base); }));
    }

    void noteProgress(std::string_view line, const Rational& base) const {
        constexpr std::string_view key = "out_time_us=";
        constexpr std::int64_t second = 1000000;
        std::int64_t microseconds = 0;
        if (line.starts_with(key) &&
            std::from_chars(line.data() + key.size(), line.data() + line.size(), microseconds).ec == std::errc())
            cut_.progress(base + Rational(microseconds, second));
    }

    const PictureCut& cut_;
    double leastDistance_;
    std::map<std::string, std::string> files_; ///< by their filters
};

// Copying ---------------------------------------------------------------------------------------------------------

/// Where packets can be cut apart: all packets before such a place are shown before all after it.
struct CleanPlaces {
    struct Place {
        std::size_t packet = 0; ///< the first one after the place
        std::int64_t time = 0;  ///< when the first frame after the place is shown
    };

    explicit CleanPlaces(const std::vector<MediaPacket>& packets) {
        std::vector<std::int64_t> earliest(packets.size()); // from a packet on
        std::int64_t time = std::numeric_limits<std::int64_t>::max();
        for (std::size_t i = packets.size(); i > 0; --i)
            earliest[i - 1] = time = std::min(time, packets[i - 1].time);
        std::int64_t latest = std::numeric_limits<std::int64_t>::min();
        for (std::size_t i = 0; i < packets.size(); ++i) {
            if (latest < earliest[i]) {
                ends.push_back({i, earliest[i]});
                if (packets[i].isKey && packets[i].time == earliest[i])
                    begins.push_back(ends.back());
            }
            latest = std::max(latest, packets[i].time);
        }
    }

    std::vector<Place> begins; ///< places at which decoding can begin
    std::vector<Place> ends;   ///< places at which it can end
};

class Copier {
public:
    explicit Copier(const PictureCut& cut) : cut_(cut), places_(cut.pictures.packets) {}

    PictureFile copied(const EditPiece& piece, const std::string& file) const {
        if (piece.isHeld() || piece.speed != 1)
            throw Failure(
                "--fast copies pictures, so that it can neither hold a frame nor change the speed; cut without "
                "--fast");
        copy(piece, file);
        return {file, pieceIn(file)};
    }

private:
    std::pair<std::size_t, std::size_t> packetsOf(const EditPiece& piece) const {
        const PictureStream& pictures = cut_.pictures;
        const auto isAfter = [&pictures](const Rational& time, const CleanPlaces::Place& place) {
            return time < pictures.secondsOf(place.time);
        };
        const auto isBefore = [&pictures](const CleanPlaces::Place& place, const Rational& time) {
            return pictures.secondsOf(place.time) < time;
        };
        const auto start = std::upper_bound(places_.begins.begin(), places_.begins.end(), piece.start, isAfter);
        const std::size_t begin = start == places_.begins.begin() ? 0 : (start - 1)->packet;
        const auto end = std::find_if(std::lower_bound(places_.ends.begin(), places_.ends.end(), piece.end, isBefore),
                                      places_.ends.end(), [&](const auto& place) { return place.packet > begin; });
        return {begin, end == places_.ends.end() ? pictures.packets.size() : end->packet};
    }

    /// Opens the source a little after the key frame: a time that is rounded must not be before it.
    void copy(const EditPiece& piece, const std::string& file) const {
        const PictureStream& pictures = cut_.pictures;
        const auto [begin, end] = packetsOf(piece);
        const Rational time = pictures.secondsOf(pictures.packets[begin].time);
        const Rational shown = distanceAfter(pictures, pictures.shownAt(time)).value_or(0);
        Words words = cut_.source.openedAt(begin == 0 ? std::nullopt : std::optional(time + shown / 4));
        const auto add = [&words](const Words& more) { words.insert(words.end(), more.begin(), more.end()); };
        add({"-map", fmt::format("0:{}", pictures.index), "-c", "copy", "-frames:v", std::to_string(end - begin)});
        add({"-f", cut_.container, addressIn(cut_, file)});
        cut_.ffmpeg.run(words,
                        fmt::format("copy the pictures of {} from {} s on", cut_.source.name, secondsFor(piece.start)));
    }

    /// Returns which part of the source is in a file.
    EditPiece pieceIn(const std::string& file) const {
        const PictureStream& pictures = cut_.pictures;
        const auto copied = mediaIn((std::filesystem::path(cut_.folder) / file).string(), file).picture;
        if (!copied || copied->frames.empty())
            refuse();
        const Rational begin = copied->secondsOf(copied->frames.front());
        const std::size_t first = pictures.nearestTo(begin); // the beginning of a file is rounded to milliseconds
        const std::size_t end = first + copied->frames.size();
        if (end > pictures.frames.size())
            refuse();
        for (std::size_t i = first; i < end; ++i)
            if (!areSameTimes(pictures.secondsOf(pictures.frames[i] - pictures.frames[first]),
                              copied->secondsOf(copied->frames[i - first]) - begin))
                refuse();
        const Rational start = pictures.secondsOf(pictures.frames[first]);
        const Rational stop = end < pictures.frames.size() ? pictures.secondsOf(pictures.frames[end])
                                                           : std::max(pictures.end(), start + Rational(1, 1000));
        return {start, stop, 1, stop - start};
    }

    [[noreturn]] void refuse() const {
        throw Failure(fmt::format("{}: its pictures cannot be copied in pieces whose times are known; cut it without "
                                  "--fast. Nothing was written",
                                  cut_.source.name));
    }

    const PictureCut& cut_;
    CleanPlaces places_;
};

} // namespace

std::vector<PictureFile> encodedPieces(const PictureCut& cut, const EditList& edits) {
    Encoder encoder(cut);
    std::vector<PictureFile> files;
    const std::vector<Rational>& bases = edits.bases();
    for (std::size_t i = 0; i < bases.size(); ++i)
        files.push_back(encoder.encoded(edits.pieces()[i], bases[i]));
    return files;
}

std::vector<PictureFile> copiedPieces(const PictureCut& cut, const EditList& edits) {
    const Copier copier(cut);
    std::vector<PictureFile> files;
    const std::vector<Rational>& bases = edits.bases();
    for (std::size_t i = 0; i < bases.size(); ++i) {
        files.push_back(copier.copied(edits.pieces()[i], fmt::format("{}.{}", i + 1, cut.container)));
        cut.progress(bases[i]);
    }
    return files;
}

bool areSameTimes(const Rational& left, const Rational& right) {
    constexpr double tolerance = 0.0001; // seconds
    return std::abs((left - right).nearest()) < tolerance;
}

} // namespace Zulm
