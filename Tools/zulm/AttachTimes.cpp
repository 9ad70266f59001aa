#include "Tools/zulm/AttachTimes.h"

#include "Tools/zulm/Choice.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/FileError.h"

#include <fmt/core.h>

#include <algorithm>
#include <fstream>
#include <limits>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// Seconds. Movies count their duration in whole units of their own, and the last entry may be as late as the last
/// frame.
constexpr double s_tolerance = 0.01;

/// Appends a stream's copy. Returns nothing for one that is no stream.
std::optional<RetimedStream> appendTo(std::ostream& output, const StreamSource& source, const Retiming& retiming) {
    const RetimedStream stream =
        orFileError(source.name(), [&] { return retimeStream(source.open(), retiming, output); });
    if (stream.isReadable)
        return stream;
    if (stream.header.uuid == MetaDataHeader().uuid)
        return std::nullopt;
    throw Failure(fmt::format("{}: nobody here knows where the times of {} are; leave it out, or attach it without "
                              "--shift and --trim",
                              source.name(), metaDataKindName(stream.header.uuid)));
}

/// The place of a stream's copy in the temporary file; empty for what is no stream.
struct CopiedPart {
    const StreamSource* original = nullptr;
    std::uint64_t begin = 0;
    std::uint64_t size = 0;
};

} // namespace

void addTimeOptions(CLI::App& command, TimeOptions& options) {
    addSeconds(command, "--shift", options.shift,
               "Add so many seconds to every time of what is attached; they may be negative", Sign::Any);
    command.add_flag("--trim", options.trims,
                     "Leave out entries before the beginning and after the end of the movie; what is in force at the "
                     "beginning stays");
}

RetimedSources::RetimedSources(const std::vector<StreamSource>& originals, const TimeOptions& options,
                               std::optional<double> duration, const std::string& folder) {
    if (!options.changesTimes()) {
        sources_ = originals;
        return;
    }
    if (options.trims && !duration)
        throw Failure("--trim: the movie does not tell how long it lasts");
    const Retiming retiming{options.shift.value_or(0), options.trims ? duration : std::nullopt};
    file_ = std::make_unique<TemporaryFile>(folder.empty() ? "." : folder, "streams", ".dat");
    std::ofstream output = openOutput(file_->path(), file_->path());
    std::vector<CopiedPart> parts;
    for (const StreamSource& original : originals) {
        const auto begin = static_cast<std::uint64_t>(output.tellp());
        const auto stream = appendTo(output, original, retiming);
        const std::uint64_t size = static_cast<std::uint64_t>(output.tellp()) - begin;
        if (!stream) {
            parts.push_back({&original}); // refused in the words of everyone who attaches it
            continue;
        }
        entriesRemoved_ += stream->entriesRemoved;
        if (stream->bytesLeftOut > 0)
            cuts_.push_back(fmt::format("{}: {} left out {} bytes after its last whole entry", original.name(),
                                        metaDataKindName(stream->header.uuid), stream->bytesLeftOut));
        if (stream->entries == 0 && stream->entriesRemoved > 0)
            warn(fmt::format("{}: no entry of {} lies in the movie; the stream is left out", original.name(),
                             metaDataKindName(stream->header.uuid)));
        else
            parts.push_back({&original, begin, size});
    }
    output.close();
    if (!output)
        throw Failure(fmt::format("{}: cannot be written", file_->path()));
    const ByteSource copies = openSource(file_->path(), file_->path());
    for (const auto& [original, begin, size] : parts)
        sources_.push_back(size == 0 ? *original
                                     : StreamSource::bytes(copies.part(begin, size), original->name()).unchecked());
}

RetimedSources::~RetimedSources() = default;

ExitCode RetimedSources::complainAboutCuts() const {
    for (const std::string& cut : cuts_)
        complain(cut);
    return cuts_.empty() ? ExitFine : ExitDamaged;
}

std::uint64_t warnOfTimesOutside(const std::string& name, std::optional<double> duration,
                                 const std::vector<StreamSource>& sources) {
    const double end = duration.value_or(std::numeric_limits<double>::infinity());
    std::uint64_t after = 0;
    std::size_t streams = 0;
    double first = 0;
    double last = 0;
    for (const StreamSource& source : sources) {
        const TimeSpan span = orFileError(source.name(), [&] { return timeSpanOf(source.open(), end + s_tolerance); });
        after += span.entriesAfter;
        streams += span.entriesAfter > 0 ? 1U : 0U;
        first = std::min(first, span.first.value_or(0));
        last = std::max(last, span.last.value_or(0));
    }
    if (after > 0)
        warn(fmt::format(
            "{}: {} {} of {} {} after the end of the movie at {:.3f} s, the last at {:.3f} s; --shift moves "
            "the times, and --trim leaves such entries out",
            name, after, after == 1 ? "entry" : "entries", streams, streams == 1 ? "stream lies" : "streams lie", end,
            last));
    if (first < -s_tolerance)
        warn(fmt::format("{}: entries lie before the beginning of the movie, the first at {:.3f} s; --shift moves the "
                         "times, and --trim leaves such entries out",
                         name, first));
    return after;
}

} // namespace Zulm
