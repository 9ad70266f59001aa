#include "Tools/zulm/MovieCut.h"

#include "Tools/zulm/Command.h"
#include "Tools/zulm/FFmpeg.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Media.h"
#include "Tools/zulm/PictureCut.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/SoundCut.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <system_error>
#include <utility>
#include <vector>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// A folder that is gone when its scope ends.
class WorkFolder {
public:
    explicit WorkFolder(const std::string& besides) {
        const std::filesystem::path folder = std::filesystem::path(besides).parent_path();
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

    const std::string& path() const { return path_; }
    std::string operator/(const std::string& name) const { return (std::filesystem::path(path_) / name).string(); }

private:
    std::string path_;
};

class MovieCut {
public:
    MovieCut(const InputFile& source, const EditList& edits, const std::string& output, const std::string& name)
        : source_{source.path(), source.name(), {}}, edits_(edits), output_(output), name_(name),
          media_(mediaIn(source.path(), source.name())), folder_(output),
          progress_("cutting " + source.name(), millisecondsOf(edits.duration()), secondsText) {
        source_.start = media_.start;
        requireMedia();
    }

    /// Encodes the pictures again.
    EditList cutExactly() {
        if (media_.picture)
            files_ = encodedPieces(pictureCut(), edits_);
        join(edits_.pieces());
        if (media_.picture)
            requireFrames();
        return edits_;
    }

    /// Copies the pictures.
    EditList cutFast() {
        if (!media_.picture)
            throw Failure(fmt::format("{}: has no pictures; cut it without --fast", source_.name));
        files_ = copiedPieces(pictureCut(), edits_);
        std::vector<EditPiece> pieces;
        for (const PictureFile& file : files_)
            pieces.push_back(file.piece);
        join(pieces);
        return piecesFound();
    }

private:
    static std::uint64_t millisecondsOf(const Rational& time) {
        return static_cast<std::uint64_t>(std::max(0.0, time.nearest()) * 1000);
    }

    void requireMedia() const {
        if (!media_.picture && media_.sounds.empty())
            throw Failure(fmt::format("{}: has neither pictures nor sound; there is nothing to cut", source_.name));
        if (media_.picture && media_.picture->frames.empty())
            throw Failure(fmt::format("{}: ffprobe finds no frame in it", source_.name));
        if (media_.otherStreams > 0)
            warn(fmt::format("{}: {} of its streams {} neither its pictures nor sound; left out", source_.name,
                             media_.otherStreams, media_.otherStreams == 1 ? "is" : "are"));
    }

    std::string container() const {
        const std::string extension = std::filesystem::path(name_).extension().string();
        return extension == ".mov" || extension == ".MOV" ? "mov" : "mp4";
    }

    PictureCut pictureCut() {
        return {ffmpeg_,         source_,
                *media_.picture, folder_.path(),
                container(),     [this](const Rational& edited) { progress_.moveTo(millisecondsOf(edited)); }};
    }

    void join(const std::vector<EditPiece>& pieces) {
        Words inputs;
        Words mapping;
        const auto add = [](Words& words, const Words& more) { words.insert(words.end(), more.begin(), more.end()); };
        if (!files_.empty()) {
            add(inputs, {"-f", "concat", "-safe", "0", "-i", mediaAddress(writtenList())});
            add(mapping, {"-map", "0:v:0"});
        }
        for (std::size_t i = 0; i < media_.sounds.size(); ++i) {
            const std::string file = folder_ / fmt::format("sound-{}.raw", i + 1);
            writeSound(ffmpeg_, source_, media_.sounds[i], pieces, file);
            add(inputs, soundInput(media_.sounds[i], file));
            add(mapping, {"-map", fmt::format("{}:a", i + (files_.empty() ? 0U : 1U))});
        }
        Words words = inputs;
        add(words, mapping);
        add(words, {"-c:v", "copy", "-c:a", "aac", "-b:a", "192k", "-map_metadata", "-1"});
        if (!files_.empty() && files_.back().name.ends_with(".nut"))
            add(words, {"-bsf:v", durationFilter(), "-video_track_timescale", std::to_string(s_ticksPerSecond)});
        add(words, {"-f", container(), mediaAddress(output_)});
        ffmpeg_.run(words, "put the pieces of " + name_ + " together");
    }

    /// The bases are rounded, not the lengths, whose differences would add up.
    std::string writtenList() const {
        constexpr std::int64_t microseconds = 1000000;
        std::string path = folder_ / "pieces.ffconcat";
        std::ofstream list(path);
        list << "ffconcat version 1.0\n";
        Rational base;
        Rational rounded;
        for (const PictureFile& file : files_) {
            base = base + file.piece.duration;
            const Rational end(std::llround((base * microseconds).nearest()), microseconds);
            list << "file " << file.name << "\nduration " << secondsFor(end - rounded) << '\n';
            rounded = end;
        }
        list.close();
        if (!list)
            throw Failure(fmt::format("{}: cannot be written; is the disk full?", path));
        return path;
    }

    /// Makes the last frame of encoded pictures last until the end: it would be as long as a usual one. No other frame
    /// lasts longer than that: a movie is as long as its frames say.
    std::string durationFilter() const {
        const auto last = mediaIn(folder_ / files_.back().name, files_.back().name).picture;
        if (!last || last->frames.empty())
            throw Failure(fmt::format("{}: ffmpeg has made no frame of its last piece; nothing was written", name_));
        const Rational end = edits_.duration();
        const Rational time = end - files_.back().piece.duration + last->secondsOf(last->frames.back());
        const Rational rounding(1, 10000);
        const std::string rest = fmt::format("round(({}-PTS*TB)/TB)", numberFor(end));
        return fmt::format("setts=duration='max(1,if(gte(PTS*TB,{}),{},min(DURATION,{})))'", numberFor(time - rounding),
                           rest, rest);
    }

    /// Reads the new movie: a frame must begin where a piece does.
    void requireFrames() const {
        const auto found = mediaIn(output_, name_).picture;
        for (const Rational& base : edits_.bases())
            if (!found || found->frames.empty() ||
                !areSameTimes(found->secondsOf(found->frames[found->nearestTo(base)]), base))
                throw Failure(fmt::format("{}: ffmpeg has made no frame at {} s, where a piece begins; nothing was "
                                          "written",
                                          name_, secondsFor(base)));
    }

    /// Reads the new movie, and returns the pieces as they are in it.
    EditList piecesFound() const {
        const auto found = mediaIn(output_, name_).picture;
        std::vector<Rational> bases;
        std::size_t place = 0;
        for (const PictureFile& file : files_) {
            const std::size_t count = framesIn(file.piece);
            if (!found || found->frames.size() - place < count || !isAt(place, *found, file.piece))
                throw Failure(fmt::format("{}: its pictures cannot be copied so that their times are known; cut it "
                                          "without --fast. Nothing was written",
                                          source_.name));
            bases.push_back(found->secondsOf(found->frames[place]));
            place += count;
        }
        EditList edits;
        if (bases.front() > 0)
            edits.hold(files_.front().piece.start, bases.front());
        for (std::size_t i = 0; i < files_.size(); ++i) {
            const EditPiece& piece = files_[i].piece;
            edits.keep(piece.start, i + 1 < files_.size() ? piece.start + bases[i + 1] - bases[i] : piece.end);
        }
        return edits;
    }

    std::size_t framesIn(const EditPiece& piece) const {
        return media_.picture->firstFrom(piece.end) - media_.picture->shownAt(piece.start);
    }

    /// Whether the frames of a piece are in the new movie, the first one at this place.
    bool isAt(std::size_t place, const PictureStream& found, const EditPiece& piece) const {
        const PictureStream& source = *media_.picture;
        const std::size_t first = source.shownAt(piece.start);
        for (std::size_t i = 0; i < framesIn(piece); ++i)
            if (!areSameTimes(found.secondsOf(found.frames[place + i] - found.frames[place]),
                              source.secondsOf(source.frames[first + i] - source.frames[first])))
                return false;
        return true;
    }

    CutSource source_;
    const EditList& edits_;
    std::string output_;
    std::string name_; ///< what the output will be called
    FFmpeg ffmpeg_;
    Media media_;
    WorkFolder folder_;
    Progress progress_;
    std::vector<PictureFile> files_;
};

} // namespace

EditList cutMovie(const InputFile& source, const EditList& edits, CutMode mode, const std::string& output,
                  const std::string& name) {
    if (edits.pieces().empty())
        throw Failure(
            fmt::format("{}: nothing of it is kept, and a movie without a frame cannot be made", source.name()));
    MovieCut cut(source, edits, output, name);
    return mode == CutMode::Exact ? cut.cutExactly() : cut.cutFast();
}

} // namespace Zulm
