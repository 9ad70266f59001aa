#include "Tools/zulm/MovieCut.h"

#include "Reports/Text.h"
#include "Tools/zulm/ChildProcess.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Media.h"
#include "Tools/zulm/Progress.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>
#include <map>
#include <system_error>
#include <vector>

namespace Zulm {

using namespace ZULMetaData;

namespace {

using Words = std::vector<std::string>;

/// Fits the usual frame rates, and the exact times of other frames within 6 microseconds.
constexpr int s_ticksPerSecond = 90000;

/// How far a frame may be from its place in the new movie.
constexpr double s_tolerance = 0.0001;

/// More frames are left out of pieces that are sped up.
constexpr double s_mostFramesPerSecond = 60;

constexpr int s_bytesPerSample = 2;

/// A number of seconds for an option or a filter of ffmpeg, which reads microseconds.
std::string seconds(const Rational& time) {
    return fmt::format("{:.6f}", time.nearest());
}

/// A number in an expression, which ffmpeg computes with doubles.
std::string number(const Rational& value) {
    return fmt::format("{:.17g}", value.nearest());
}

Rational middle(const Rational& left, const Rational& right) {
    return (left + right) / 2;
}

/// A folder that is gone when its scope ends.
class WorkFolder {
public:
    explicit WorkFolder(const std::string& output) {
        const std::filesystem::path folder = std::filesystem::path(output).parent_path();
        path_ = ((folder.empty() ? "." : folder) / ".zulm-cut.XXXXXX").string();
        if (!mkdtemp(path_.data()))
            throw Failure(fmt::format("{}: cannot be created: {}", path_, std::strerror(errno)));
    }
    ~WorkFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    WorkFolder(const WorkFolder&) = delete;
    WorkFolder& operator=(const WorkFolder&) = delete;

    std::string operator/(const std::string& name) const { return (std::filesystem::path(path_) / name).string(); }

private:
    std::string path_;
};

/// The programs of ffmpeg in PATH.
class FFmpeg {
public:
    FFmpeg() {
        std::string version;
        run({"-version"}, "tell its version", inLines([&version](std::string_view line) {
                if (version.empty())
                    version = line;
            }));
        version_ = numberAfter(version, "version ");
    }

    /// The option was renamed in version 5.1.
    std::string frameRateOption() const { return version_ != 0 && version_ < 5.1 ? "-vsync" : "-fps_mode"; }

    void requireEncoder(const std::string& encoder) const {
        bool isThere = false;
        run({"-hide_banner", "-encoders"}, "list its encoders", inLines([&](std::string_view line) {
                isThere = isThere || line.find(' ' + encoder + ' ') != std::string_view::npos;
            }));
        if (!isThere)
            throw Failure(fmt::format("ffmpeg has no encoder {}; install one that has, or cut with --fast", encoder));
    }

    void run(
        const Words& options, const std::string& what,
        const std::function<void(std::string_view)>& take = [](std::string_view) {}) const {
        Words words{"ffmpeg", "-nostdin", "-v", "error", "-y"};
        words.insert(words.end(), options.begin(), options.end());
        const ChildResult result = runChild(words, take);
        requireDone("ffmpeg", result.exitCode, result.errors, what);
    }

private:
    static double numberAfter(const std::string& text, const std::string& words) {
        const std::size_t place = text.find(words);
        return place == std::string::npos ? 0 : std::strtod(text.c_str() + place + words.size(), nullptr);
    }

    double version_ = 0; ///< 0 if it is not a number
};

/// A piece with its pictures in a file.
struct PictureFile {
    std::string name; ///< in the folder of the work
    EditPiece piece;
};

/// Where packets can be cut apart: all packets before such a place are shown before all after it.
struct CleanPlaces {
    struct Place {
        std::size_t packet = 0; ///< the first one after the place
        std::int64_t time = 0;  ///< when the first frame after the place is shown
    };

    explicit CleanPlaces(const std::vector<MediaPacket>& packets) {
        std::vector<std::int64_t> earliest(packets.size()); // from a packet on
        for (std::size_t i = packets.size(); i > 0; --i)
            earliest[i - 1] = i < packets.size() ? std::min(earliest[i], packets[i - 1].time) : packets[i - 1].time;
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

/// What the new movie is made from.
class Cutter {
public:
    Cutter(const InputFile& source, const EditList& edits, const std::string& output)
        : path_(source.path()), name_(source.name()), edits_(edits), media_(mediaIn(path_, name_)), folder_(output),
          progress_("cutting " + name_, millisecondsOf(edits.duration()), secondsText) {
        if (!media_.picture && media_.sounds.empty())
            throw Failure(fmt::format("{}: has neither pictures nor sound; there is nothing to cut", name_));
        if (media_.picture && media_.picture->frames.empty())
            throw Failure(fmt::format("{}: ffprobe finds no frame in it", name_));
        if (media_.otherStreams > 0)
            warn(fmt::format("{}: {} of its streams {} neither its pictures nor sound; left out", name_,
                             media_.otherStreams, media_.otherStreams == 1 ? "is" : "are"));
    }

    EditList cut(CutMode mode, const std::string& output, const std::string& name) {
        if (mode == CutMode::Exact) {
            if (media_.picture)
                encodePieces();
            join(edits_.pieces(), output, name);
            requireBases(output);
            return edits_;
        }
        copyPieces();
        std::vector<EditPiece> pieces;
        for (const PictureFile& file : pictures_)
            pieces.push_back(file.piece);
        join(pieces, output, name);
        return foundIn(output, pieces);
    }

private:
    static std::uint64_t millisecondsOf(const Rational& time) {
        return static_cast<std::uint64_t>(std::max(0.0, time.nearest()) * 1000);
    }

    // Pictures that are encoded again ------------------------------------------------------------------------------

    void encodePieces() {
        ffmpeg_.requireEncoder("libx264");
        leastDistance_ = leastDistance();
        std::map<std::string, std::string> known; // what is repeated is encoded once
        Rational base;
        for (const EditPiece& piece : edits_.pieces()) {
            const std::string filter = filterFor(piece);
            std::string& file = known[filter];
            if (file.empty()) {
                file = fmt::format("{}.nut", known.size());
                encode(piece, filter, file, millisecondsOf(base));
            }
            pictures_.push_back({file, piece});
            base = base + piece.duration;
            progress_.moveTo(millisecondsOf(base));
        }
    }

    /// The frames of a piece, as places in the frames of the source: what is shown at its start, and what follows
    /// before its end.
    std::pair<std::size_t, std::size_t> framesOf(const EditPiece& piece) const {
        const std::size_t first = media_.picture->shownAt(piece.start);
        return {first, std::max(first + 1, piece.isHeld() ? 0 : media_.picture->firstFrom(piece.end))};
    }

    /// A time between this frame and the one before it.
    std::optional<Rational> timeBefore(std::size_t frame) const {
        const PictureStream& picture = *media_.picture;
        if (frame == 0 || frame >= picture.frames.size())
            return std::nullopt;
        return middle(picture.secondsOf(picture.frames[frame - 1]), picture.secondsOf(picture.frames[frame]));
    }

    std::string filterFor(const EditPiece& piece) const {
        const auto [first, end] = framesOf(piece);
        std::string filter;
        if (const auto start = timeBefore(first))
            filter += fmt::format("trim=start={},", seconds(*start));
        if (const auto stop = timeBefore(end))
            filter += fmt::format("trim=end={},", seconds(*stop));
        filter += fmt::format("settb=1/1000000000,setpts='round(max(0,(PTS*TB-{})/{})/TB)'", number(piece.start),
                              number(piece.speed));
        if (piece.speed > 1)
            filter += fmt::format(",select='isnan(prev_selected_t)+gte(t-prev_selected_t,{:.9f})'", leastDistance_);
        return filter;
    }

    /// How far frames of a piece that is sped up are apart at least.
    double leastDistance() const {
        const PictureStream& picture = *media_.picture;
        std::vector<double> distances{1 / s_mostFramesPerSecond};
        for (std::size_t i = 1; i < picture.frames.size(); ++i)
            distances.push_back(picture.secondsOf(picture.frames[i] - picture.frames[i - 1]).nearest());
        const auto middleOne = distances.begin() + static_cast<std::ptrdiff_t>(distances.size() / 2);
        std::nth_element(distances.begin(), middleOne, distances.end());
        constexpr double tolerance = 0.9; // distances are rounded
        return tolerance * std::min(1 / s_mostFramesPerSecond, *middleOne);
    }

    void encode(const EditPiece& piece, const std::string& filter, const std::string& file, std::uint64_t done) {
        Words words = inputFrom(timeBefore(framesOf(piece).first));
        const Words encoding{"-map",
                             fmt::format("0:{}", media_.picture->index),
                             "-vf",
                             filter,
                             ffmpeg_.frameRateOption(),
                             "passthrough",
                             "-enc_time_base",
                             fmt::format("1:{}", s_ticksPerSecond),
                             "-c:v",
                             "libx264",
                             "-bf", // so that frames are stored in the order in which they are shown
                             "0",
                             "-crf",
                             "18",
                             "-f",
                             "nut",
                             "-progress",
                             "pipe:1",
                             mediaAddress(folder_ / file)};
        words.insert(words.end(), encoding.begin(), encoding.end());
        ffmpeg_.run(words, fmt::format("cut the pictures of {} from {} s on", name_, seconds(piece.start)),
                    inLines([this, done](std::string_view line) { showProgress(line, done); }));
    }

    void showProgress(std::string_view line, std::uint64_t done) {
        constexpr std::string_view key = "out_time_us=";
        std::uint64_t microseconds = 0;
        if (line.starts_with(key) &&
            std::from_chars(line.data() + key.size(), line.data() + line.size(), microseconds).ec == std::errc())
            progress_.moveTo(done + microseconds / 1000);
    }

    /// The options that open the source. Times stay those of the source.
    Words inputFrom(const std::optional<Rational>& start) const {
        Words words{"-copyts"};
        if (start && *start > media_.start)
            words.insert(words.end(), {"-ss", seconds(*start - media_.start)});
        words.insert(words.end(), {"-i", mediaAddress(path_)});
        return words;
    }

    // Pictures that are copied -------------------------------------------------------------------------------------

    void copyPieces() {
        if (!media_.picture)
            throw Failure(fmt::format("{}: has no pictures; cut it without --fast", name_));
        for (const EditPiece& piece : edits_.pieces())
            if (piece.isHeld() || piece.speed != 1)
                throw Failure("--fast copies pictures, so that it can neither hold a frame nor change the speed; cut "
                              "without --fast");
        const CleanPlaces places(media_.picture->packets);
        for (const EditPiece& piece : edits_.pieces()) {
            const std::string file = fmt::format("{}.mov", pictures_.size() + 1);
            copy(places, piece, file);
            pictures_.push_back({file, copiedPiece(file)});
        }
    }

    /// The packets from a key frame at or before the start to the end or a little after it.
    std::pair<std::size_t, std::size_t> packetsOf(const CleanPlaces& places, const EditPiece& piece) const {
        const PictureStream& picture = *media_.picture;
        const auto isAfter = [&picture](const Rational& time, const CleanPlaces::Place& place) {
            return time < picture.secondsOf(place.time);
        };
        const auto isBefore = [&picture](const CleanPlaces::Place& place, const Rational& time) {
            return picture.secondsOf(place.time) < time;
        };
        const auto start = std::upper_bound(places.begins.begin(), places.begins.end(), piece.start, isAfter);
        const std::size_t begin = start == places.begins.begin() ? 0 : (start - 1)->packet;
        const auto end = std::find_if(std::lower_bound(places.ends.begin(), places.ends.end(), piece.end, isBefore),
                                      places.ends.end(), [&](const auto& place) { return place.packet > begin; });
        return {begin, end == places.ends.end() ? picture.packets.size() : end->packet};
    }

    void copy(const CleanPlaces& places, const EditPiece& piece, const std::string& file) {
        const auto [begin, end] = packetsOf(places, piece);
        const PictureStream& picture = *media_.picture;
        const std::size_t frame = picture.shownAt(picture.secondsOf(picture.packets[begin].time));
        Words words = inputFrom(begin == 0 ? std::nullopt : std::optional(afterFrame(frame)));
        const Words copying{
            "-map", fmt::format("0:{}", picture.index), "-c", "copy", "-frames:v", std::to_string(end - begin), "-f",
            "mov",  mediaAddress(folder_ / file)};
        words.insert(words.end(), copying.begin(), copying.end());
        ffmpeg_.run(words, fmt::format("copy the pictures of {} from {} s on", name_, seconds(piece.start)));
    }

    /// A time at which this frame is shown: one that is rounded must not be before it.
    Rational afterFrame(std::size_t frame) const { return timeBefore(frame + 1).value_or(media_.picture->end()); }

    /// Returns which frames of the source are in a file of copied packets.
    EditPiece copiedPiece(const std::string& file) const {
        const PictureStream& picture = *media_.picture;
        const auto copied = mediaIn(folder_ / file, file).picture;
        if (!copied || copied->frames.empty())
            throw Failure(fmt::format("{}: ffmpeg has copied no pictures; cut it without --fast", name_));
        const std::size_t first = picture.shownAt(copied->secondsOf(copied->frames.front()) + Rational(1, 1000000));
        const std::size_t end = first + copied->frames.size();
        bool isSame = end <= picture.frames.size();
        for (std::size_t i = first; isSame && i < end; ++i)
            isSame = areNear(picture.secondsOf(picture.frames[i]), copied->secondsOf(copied->frames[i - first]));
        if (!isSame)
            throw Failure(fmt::format("{}: its pictures cannot be copied in pieces that are known exactly; cut it "
                                      "without --fast",
                                      name_));
        const Rational start = picture.secondsOf(picture.frames[first]);
        const Rational stop = end < picture.frames.size() ? picture.secondsOf(picture.frames[end])
                                                          : std::max(picture.end(), start + Rational(1, 1000));
        return {start, stop, 1, stop - start};
    }

    static bool areNear(const Rational& left, const Rational& right) {
        return std::abs((left - right).nearest()) < s_tolerance;
    }

    // Sound --------------------------------------------------------------------------------------------------------

    /// The rate at which a sound is encoded.
    static int rateOf(const SoundStream& sound) {
        constexpr std::array rates{8000, 11025, 12000, 16000, 22050, 24000, 32000, 44100, 48000};
        constexpr int usual = 48000;
        return std::find(rates.begin(), rates.end(), sound.sampleRate) == rates.end() ? usual : sound.sampleRate;
    }

    /// Writes the samples of all pieces, so many of each that every piece begins at its time.
    void writeSound(const SoundStream& sound, const std::vector<EditPiece>& pieces, const std::string& file) {
        std::ofstream output(folder_ / file, std::ios::binary);
        const auto sampleSize = static_cast<std::uint64_t>(sound.channels * s_bytesPerSample);
        Rational base;
        std::uint64_t written = 0; // samples
        for (const EditPiece& piece : pieces) {
            base = base + piece.duration;
            const auto end = static_cast<std::uint64_t>(std::llround((base * rateOf(sound)).nearest()));
            std::uint64_t left = (end - written) * sampleSize;
            if (!piece.isHeld())
                takeSound(sound, piece, [&](std::string_view bytes) {
                    const auto taken = static_cast<std::size_t>(std::min<std::uint64_t>(bytes.size(), left));
                    output.write(bytes.data(), static_cast<std::streamsize>(taken));
                    left -= taken;
                });
            const std::string silence(1 << 16, '\0');
            for (; left > 0; left -= std::min<std::uint64_t>(left, silence.size()))
                output.write(silence.data(),
                             static_cast<std::streamsize>(std::min<std::uint64_t>(left, silence.size())));
            written = end;
        }
        output.close();
        if (!output)
            throw Failure(fmt::format("{}: the sound cannot be written; is the disk full?", folder_ / file));
    }

    void takeSound(const SoundStream& sound, const EditPiece& piece,
                   const std::function<void(std::string_view)>& take) const {
        constexpr int lead = 1; // seconds; decoding begins before what is heard
        Words words = inputFrom(piece.start - lead);
        const std::string filter = fmt::format(
            "atrim=start={}:end={},asetpts=PTS-{}/TB,aresample={}:async=1:first_pts=0{}", seconds(piece.start),
            seconds(piece.end), number(piece.start), rateOf(sound), tempoFilter(piece.speed.nearest()));
        const Words decoding{"-map",  fmt::format("0:{}", sound.index), "-af", filter,
                             "-ac",   std::to_string(sound.channels),   "-f",  "s16le",
                             "pipe:1"};
        words.insert(words.end(), decoding.begin(), decoding.end());
        ffmpeg_.run(words, fmt::format("cut the sound of {} from {} s on", name_, seconds(piece.start)), take);
    }

    /// One filter changes the tempo by a limited factor.
    static std::string tempoFilter(double speed) {
        constexpr double most = 100;
        constexpr double least = 0.5;
        std::string filter;
        while (speed != 1) {
            const double factor = std::clamp(speed, least, most);
            filter += fmt::format(",atempo={:.17g}", factor);
            speed /= factor;
        }
        return filter;
    }

    // The movie ----------------------------------------------------------------------------------------------------

    void join(const std::vector<EditPiece>& pieces, const std::string& output, const std::string& name) {
        Words words;
        Words mapping;
        if (!pictures_.empty()) {
            writeList();
            words = {"-f", "concat", "-safe", "0", "-i", mediaAddress(folder_ / s_list)};
            mapping = {"-map", "0:v:0"};
        }
        for (std::size_t i = 0; i < media_.sounds.size(); ++i) {
            const std::string file = fmt::format("sound-{}.raw", i + 1);
            writeSound(media_.sounds[i], pieces, file);
            mapping.insert(mapping.end(), {"-map", fmt::format("{}:a", i + (pictures_.empty() ? 0U : 1U))});
            words.insert(words.end(), {"-f", "s16le", "-ar", std::to_string(rateOf(media_.sounds[i])), "-ac",
                                       std::to_string(media_.sounds[i].channels), "-i", mediaAddress(folder_ / file)});
        }
        words.insert(words.end(), mapping.begin(), mapping.end());
        words.insert(words.end(), {"-c:v", "copy", "-c:a", "aac", "-b:a", "192k", "-map_metadata", "-1"});
        if (const std::string filter = lastFrameFilter(); !filter.empty())
            words.insert(words.end(), {"-bsf:v", filter, "-video_track_timescale", std::to_string(s_ticksPerSecond)});
        const std::string extension = std::filesystem::path(name).extension().string();
        words.insert(words.end(), {"-f", extension == ".mov" || extension == ".MOV" ? "mov" : "mp4"});
        words.push_back(mediaAddress(output));
        ffmpeg_.run(words, "put the pieces together");
    }

    /// The bases are rounded, not the lengths: they would add up to a difference.
    void writeList() {
        std::ofstream list(folder_ / s_list);
        list << "ffconcat version 1.0\n";
        Rational base;
        Rational rounded;
        for (const PictureFile& file : pictures_) {
            base = base + file.piece.duration;
            const Rational end(std::llround((base * 1000000).nearest()), 1000000);
            list << "file " << file.name << "\nduration " << seconds(end - rounded) << '\n';
            rounded = end;
        }
        list.close();
        if (!list)
            throw Failure(fmt::format("{}: cannot be written; is the disk full?", folder_ / s_list));
    }

    /// The last frame of encoded pictures would be as long as a usual one; it must last until the end.
    std::string lastFrameFilter() const {
        if (pictures_.empty() || !pictures_.back().name.ends_with(".nut"))
            return {};
        const auto last = mediaIn(folder_ / pictures_.back().name, pictures_.back().name).picture;
        if (!last || last->frames.empty())
            throw Failure(fmt::format("{}: ffmpeg has made no picture of its last piece", name_));
        const Rational time = last->secondsOf(last->frames.back());
        const Rational& length = pictures_.back().piece.duration;
        const Rational end = edits_.duration();
        const Rational start = end - length + time - Rational(1, 10000);
        return fmt::format("setts=duration='if(gte(PTS*TB,{}),max(1,round(({}-PTS*TB)/TB)),DURATION)'", number(start),
                           number(end));
    }

    Media readBack(const std::string& output) const { return mediaIn(output, "the new movie"); }

    /// Every piece must begin with a frame.
    void requireBases(const std::string& output) const {
        const auto picture = readBack(output).picture;
        if (!media_.picture)
            return;
        Rational base;
        for (const EditPiece& piece : edits_.pieces()) {
            const bool isThere =
                picture && !picture->frames.empty() &&
                areNear(picture->secondsOf(picture->frames[picture->shownAt(base + Rational(1, 10000))]), base);
            if (!isThere)
                throw Failure(fmt::format("{}: ffmpeg has made no frame at {} s, where a piece begins; nothing was "
                                          "written",
                                          name_, seconds(base)));
            base = base + piece.duration;
        }
    }

    /// Returns the pieces as they are in the new movie.
    EditList foundIn(const std::string& output, const std::vector<EditPiece>& pieces) const {
        const PictureStream& source = *media_.picture;
        const auto found = readBack(output).picture;
        EditList edits;
        std::size_t place = 0;
        std::vector<Rational> bases;
        for (const EditPiece& piece : pieces) {
            const std::size_t first = source.shownAt(piece.start);
            const std::size_t count = source.firstFrom(piece.end) - first;
            if (!found || found->frames.size() < place + count)
                refuseFound();
            const Rational base = found->secondsOf(found->frames[place]);
            for (std::size_t i = 0; i < count; ++i)
                if (!areNear(found->secondsOf(found->frames[place + i]) - base,
                             source.secondsOf(source.frames[first + i]) - piece.start))
                    refuseFound();
            bases.push_back(base);
            place += count;
        }
        if (!bases.empty() && bases.front() > 0)
            edits.hold(pieces.front().start, bases.front());
        for (std::size_t i = 0; i < pieces.size(); ++i)
            edits.keep(pieces[i].start,
                       i + 1 < pieces.size() ? pieces[i].start + bases[i + 1] - bases[i] : pieces[i].end);
        return edits;
    }

    [[noreturn]] void refuseFound() const {
        throw Failure(fmt::format("{}: its pictures cannot be copied so that their times are known; cut it without "
                                  "--fast. Nothing was written",
                                  name_));
    }

    static constexpr auto s_list = "pieces.ffconcat";

    std::string path_;
    std::string name_;
    const EditList& edits_;
    FFmpeg ffmpeg_;
    Media media_;
    WorkFolder folder_;
    Progress progress_;
    std::vector<PictureFile> pictures_;
    double leastDistance_ = 0; ///< of frames of pieces that are sped up, in seconds
};

} // namespace

EditList cutMovie(const InputFile& source, const EditList& edits, CutMode mode, const std::string& output,
                  const std::string& name) {
    if (edits.pieces().empty())
        throw Failure(
            fmt::format("{}: nothing of it is kept, and a movie without a frame cannot be made", source.name()));
    return Cutter(source, edits, output).cut(mode, output, name);
}

} // namespace Zulm
