#include "Tools/render/Production.h"

#include "Tools/render/JsonFields.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace Render {

using namespace ZULMetaData;
using Zulm::Failure;

namespace {

constexpr double s_largestSide = 4096; ///< of a film whose size nobody asked for

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
    : options_(options), style_(styleFor(options)), input_(options.recording), recording_(input_.openSession()),
      pictures_(input_.path(), input_.name()) {
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
    std::ofstream(redactedFile_->path(), std::ios::binary) << std::string("\0\0\0\x10"
                                                                          "ftypisom\0\0\2\0",
                                                                          16);
    std::vector<StreamSource> sources;
    for (const std::string& stream : redacted.streams)
        sources.push_back(StreamSource::memory(stream, recording_.name()).asStored());
    try {
        if (!sources.empty())
            SafeMovieSave(redactedFile_->path()).attach(sources);
    } catch (const SaveError& error) {
        throw Failure(error.what());
    }
    redacted_ = std::make_unique<Recording>(FileLocation(redactedFile_->path()));
}

double Production::duration() const {
    const double length = recording_.duration().value_or(pictures_.duration().value_or(0));
    if (!(length > 0) || length > 1e7)
        throw Failure(
            fmt::format("{}: does not tell how long it is; say with --keep what is shown", recording_.name()));
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
    const double width = pictures_.width() * pictures_.pixelAspect();
    const double height = pictures_.height();
    const double scale = std::min({1.0, s_largestSide / width, s_largestSide / height, largestWidth / width});
    const auto even = [](double value) { return std::max(16, 2 * static_cast<int>(std::lround(value / 2))); };
    return {even(width * scale), even(height * scale)};
}

void Production::prepare(const EditList& edits, const std::string& zoom, int largestWidth) {
    if (edits.pieces().empty())
        throw Failure(
            fmt::format("{}: nothing of it is kept, and a film without a frame cannot be made", recording_.name()));
    style_.zoom.isAutomatic = zoom.empty() ? style_.zoom.isAutomatic : zoom == "auto";
    const PictureSize movie{pictures_.width() * pictures_.pixelAspect(), static_cast<double>(pictures_.height())};
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
    composer_ = std::make_unique<Composer>(*session_, pictures_, *stage_, style_, cover);
}

Zulm::ExitCode Production::complain() const {
    const EditedRecording& edited = session_->edited();
    for (const std::string& warning : edited.warnings)
        Zulm::warn(fmt::format("{}: {}", recording_.name(), warning));
    std::vector<std::string> losses = losses_;
    losses.insert(losses.end(), edited.losses.begin(), edited.losses.end());
    if (pictures_.endedEarly())
        losses.emplace_back(
            "its pictures end before the movie does, as in a file that was cut off; the last one stays");
    for (const std::string& loss : losses)
        Zulm::complain(fmt::format("{}: {}", recording_.name(), loss));
    return losses.empty() ? Zulm::ExitFine : Zulm::ExitDamaged;
}

std::string Production::shownRegion(const ByteSource& stored) const {
    const ScreenRect& region = session_->region();
    const PixelRect& frame = stage_->frame();
    const double unitX = region.width / frame.width;
    const double unitY = region.height / frame.height;
    const auto whole = [](double value) {
        return static_cast<std::int32_t>(std::lround(std::clamp(value, -2e9, 2e9)));
    };
    const Rect shown(whole(region.x - frame.x * unitX), whole(region.y - frame.y * unitY),
                     whole(stage_->film().width * unitX), whole(stage_->film().height * unitY));
    std::string header(s_metaDataHeaderSize, '\0');
    if (stored.read(0, header) < header.size())
        return {};
    std::ostringstream bytes;
    bytes << header;
    metaDataWrite<Rect>(0, shown, bytes, 1);
    return bytes.str();
}

std::vector<StreamSource> Production::streams() {
    std::vector<StreamSource> sources;
    for (const EditedStream& stream : session_->edited().streams) {
        if (stream.source.type == RecordingRegionKind::type)
            region_ = shownRegion(stream.bytes);
        const bool isRegion = stream.source.type == RecordingRegionKind::type && !region_.empty();
        sources.push_back((isRegion ? StreamSource::memory(region_, recording_.name())
                                    : StreamSource::bytes(stream.bytes, recording_.name()))
                              .asStored());
    }
    return sources;
}

} // namespace Render
