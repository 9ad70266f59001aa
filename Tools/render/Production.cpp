#include "Tools/render/Production.h"

#include "Tools/render/JsonFields.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace Render {

using namespace ZULMetaData;
using Zulm::Failure;

namespace {

constexpr double s_largestSide = 4096; ///< of a film whose size nobody asked for
constexpr int s_regionVersion = 1;
constexpr double s_longest = 1e7; ///< seconds of a recording, and of a film

/// Throws `Failure` if a film has no frame, or more of them than anybody can have recorded.
void requireLength(const EditList& edits, const std::string& recording) {
    if (edits.pieces().empty())
        throw Failure(fmt::format("{}: nothing of it is kept, and a film without a frame cannot be made", recording));
    const bool isFine = edits.duration().nearest() <= s_longest &&
                        std::all_of(edits.pieces().begin(), edits.pieces().end(),
                                    [](const EditPiece& piece) { return piece.end.nearest() <= s_longest; });
    if (!isFine)
        throw Failure(
            fmt::format("{}: the pieces of the film are longer than {:.0f} s; keep less of it", recording, s_longest));
}

Style styleFor(const SourceOptions& options) {
    Style style = styleOf(options.style);
    if (!options.keys.empty())
        style.keys.display = keyDisplayOf(options.keys).value_or(style.keys.display);
    style.cursor.size = options.cursorSize.value_or(style.cursor.size);
    if (options.isRaw)
        style.cursor.isSmooth = false;
    if (options.hideAfter)
        style.cursor.hideAfter = options.hideAfter;
    return style;
}

} // namespace

Production::Production(const SourceOptions& options)
    : options_(options), style_(styleFor(options)), input_(options.recording), recording_(input_.openSession()) {
    if (recording_.streams().empty())
        return;
    pictures_ = std::make_unique<PictureReader>(input_.path(), input_.name());
    if (!options.redactions.empty())
        redactions_ = Redactions::read(shortFile(options.redactions, "a list of redactions"), options.redactions);
    if (!redactions_.empty())
        redact();
}

Production::~Production() = default;

void Production::redact() {
    const RedactedStreams redacted = redactions_.redacted(recording_);
    losses_ = redacted.losses;
    redactedFile_ =
        std::make_unique<Zulm::TemporaryFile>(std::filesystem::temp_directory_path().string(), "redacted", ".mp4");
    using namespace std::string_literals;
    std::ofstream file = Zulm::openOutput(redactedFile_->path(), redactedFile_->path());
    file << "\0\0\0\x10"s
            "ftypisom\0\0\2\0"s;
    file.close();
    if (!file)
        throw Failure(fmt::format("{}: cannot be written; is the disk full?", redactedFile_->path()));
    std::vector<StreamSource> sources;
    for (const std::string& stream : redacted.streams)
        sources.push_back(StreamSource::memory(stream, recording_.name()).asStored());
    try {
        if (!sources.empty())
            SafeMovieSave(redactedFile_->path()).attach(sources);
    } catch (const SaveError& error) {
        throw Failure(error.what());
    }
    redacted_ = std::make_unique<Recording>(openSource(redactedFile_->path(), recording_.name()), recording_.name());
}

double Production::duration() const {
    const double length = recording_.duration().value_or(pictures_->duration().value_or(0));
    if (!(length > 0))
        throw Failure(
            fmt::format("{}: does not tell how long it is; say with --keep what is shown", recording_.name()));
    if (length > s_longest)
        throw Failure(
            fmt::format("{}: says that it is {:.0f} s long; say with --keep what is shown", recording_.name(), length));
    return length;
}

EditList Production::whole() const {
    EditList edits;
    edits.keep(Rational(0), Rational::of(duration()));
    return edits;
}

EditList Production::withoutIdle(double least, double rest) const {
    const InsightSources sources = insightSourcesOf(recording_, [](const Error&) {}); // times alone
    std::vector<EditRange> removed;
    const double length = duration();
    for (const IdleSpan& span : idleSpansOf(sources.positions, sources.actions, sources.keys, sources.scrolling, length,
                                            {std::max(least, rest + 0.1)}))
        removed.push_back({Rational::of(span.start + rest / 2), Rational::of(span.end - rest / 2)});
    return removed.empty() ? whole() : EditList::without(std::move(removed), Rational::of(length));
}

FilmSize Production::sizeFor(int largestWidth) const {
    if (options_.size)
        return *options_.size;
    const double width = pictures_->width() * pictures_->pixelAspect();
    const double height = pictures_->height();
    const double scale = std::min({1.0, s_largestSide / width, s_largestSide / height, largestWidth / width});
    const auto even = [](double value) { return std::max(16, 2 * static_cast<int>(std::lround(value / 2))); };
    return {even(width * scale), even(height * scale)};
}

void Production::prepare(const EditList& edits, const std::string& zoom, int largestWidth) {
    requireLength(edits, recording_.name());
    style_.zoom.isAutomatic = zoom.empty() ? style_.zoom.isAutomatic : zoom == "auto";
    const PictureSize movie{pictures_->width() * pictures_->pixelAspect(), static_cast<double>(pictures_->height())};
    stage_ = std::make_unique<Stage>(sizeFor(largestWidth), movie, style_);
    session_ = std::make_unique<FilmSession>(shown(), edits, style_, movie,
                                             [](const Error& error) { Zulm::warn(error.what()); });
    if (!zoom.empty() && zoom != "auto" && zoom != "off")
        session_->setZooms(readZooms(zoom, session_->region()));
    Cover cover;
    if (!redactions_.empty()) {
        cover.picture = [this](YuvPicture& picture, double time) {
            return redactions_.cover(picture, time, session_->region());
        };
        cover.hides = [this](const ScreenPoint& position, double time) {
            return redactions_.hidesCursor(position, time);
        };
    }
    composer_ = std::make_unique<Composer>(*session_, *pictures_, *stage_, style_, cover);
}

Zulm::ExitCode Production::complain() const {
    std::vector<std::string> losses = losses_;
    if (pictures_->cannotSeek())
        losses.emplace_back("its pictures cannot be sought in; the film shows later ones where it goes back");
    if (pictures_->endedEarly())
        losses.emplace_back(
            "its pictures end before the movie does, as in a file that was cut off; the last one stays");
    for (const std::string& loss : losses)
        Zulm::complain(fmt::format("{}: {}", recording_.name(), loss));
    const Zulm::ExitCode code = session_->streams().complain();
    return losses.empty() ? code : Zulm::ExitDamaged;
}

Rect Production::shownRegion() const {
    const ScreenRect& region = session_->region();
    const PixelRect& frame = stage_->frame();
    const double unitX = region.width / frame.width;
    const double unitY = region.height / frame.height;
    const auto whole = [](double value) {
        return static_cast<std::int32_t>(std::lround(std::clamp(value, -2e9, 2e9)));
    };
    return Rect(whole(region.x - frame.x * unitX), whole(region.y - frame.y * unitY),
                whole(stage_->film().width * unitX), whole(stage_->film().height * unitY));
}

Zulm::RetimedStreams& Production::streams() {
    Zulm::RetimedStreams& streams = session_->streams();
    const PixelRect& frame = stage_->frame();
    const bool showsMovieAlone = frame.width == stage_->film().width && frame.height == stage_->film().height &&
                                 frame.width == pictures_->width() && frame.height == pictures_->height();
    if (!recording_.has(RecordingRegionKind::type) && showsMovieAlone)
        return streams;
    const MetaDataHeader header{RecordingRegionKind::type, s_regionVersion, metaDataFixedEntrySize<Rect>()};
    const auto headerBytes = std::bit_cast<std::array<char, sizeof header>>(header);
    std::ostringstream bytes;
    bytes.write(headerBytes.data(), headerBytes.size());
    metaDataWrite<Rect>(0, shownRegion(), bytes, s_regionVersion);
    streams.replace(RecordingRegionKind::type, bytes.str());
    return streams;
}

} // namespace Render
