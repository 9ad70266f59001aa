#include "Tools/zulm/RetimedStreams.h"

#include "Reports/Report.h"
#include "Reports/Text.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaDataBridge/Source/FileError.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>
#include <fstream>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

/// Movies count their lengths in frames and in units of their own.
constexpr double s_mostDifference = 0.1;

} // namespace

ExitCode complainAboutNoStreams(const Recording& recording) {
    Zulm::complain(
        fmt::format("{}: has no recording metadata; nothing was written. 'zulm salvage {} -o DIR' finds what "
                    "no reader does",
                    recording.name(), shellWord(recording.name())));
    return ExitNoMetaData;
}

RetimedStreams::RetimedStreams(const Recording& recording, const EditList& edits, const std::string& folder)
    : name_(recording.name()),
      file_(std::make_unique<TemporaryFile>(folder.empty() ? "." : folder, "streams", ".dat")) {
    std::ofstream output = openOutput(file_->path(), file_->path());
    const auto requireGood = [&] {
        if (!output)
            throw Failure(fmt::format("{}: cannot be written: {}", file_->path(), std::strerror(errno)));
    };
    edited_ = retimed(recording, edits, [&](std::string_view bytes) {
        output.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        requireGood();
    });
    output.close();
    requireGood();
    const ByteSource retimedBytes = openSource(file_->path(), file_->path());
    for (EditedStream& stream : edited_.streams)
        if (!stream.isCopied)
            stream.bytes = retimedBytes.part(stream.offset, stream.size);
}

RetimedStreams::~RetimedStreams() = default;

void RetimedStreams::replace(const uuid& kind, std::string bytes) {
    auto found = std::find_if(edited_.streams.begin(), edited_.streams.end(),
                              [&kind](const EditedStream& stream) { return stream.source.type == kind; });
    if (found == edited_.streams.end())
        found = edited_.streams.insert(found, EditedStream{});
    found->source.type = kind;
    found->isCopied = true;
    found->bytes = ByteSource::memory(replacements_.emplace_back(std::move(bytes)));
    found->size = found->bytes.size();
}

std::vector<StreamSource> RetimedStreams::sources() const {
    std::vector<StreamSource> sources;
    for (const EditedStream& stream : edited_.streams)
        sources.push_back(StreamSource::bytes(stream.bytes, name_).asStored());
    return sources;
}

AttachResult RetimedStreams::attachTo(const std::string& movie, const std::string& name,
                                      SafeMovieSave::FragmentIndex index) const {
    if (edited_.streams.empty())
        return {};
    try {
        std::unique_ptr<Progress> shown;
        const auto progress = [&](std::uint64_t done, std::uint64_t total) {
            if (!shown)
                shown = std::make_unique<Progress>("attaching to " + name, total);
            shown->moveTo(done);
        };
        return SafeMovieSave(movie, progress).attach(sources(), ExistingStreams::Refuse, index);
    } catch (const SaveError& error) {
        throw Failure(
            fmt::format("{}: {}; nothing was written", error.file() == movie ? name : error.file(), error.sentence()));
    }
}

ExitCode RetimedStreams::complain() const {
    for (const std::string& warning : edited_.warnings)
        warn(fmt::format("{}: {}", name_, warning));
    for (const std::string& loss : edited_.losses)
        Zulm::complain(fmt::format("{}: {}", name_, loss));
    return edited_.losses.empty() ? ExitFine : ExitDamaged;
}

void RetimedStreams::print(const AttachResult& attached) const {
    writeOutput(heading(fmt::format("  {:<23}  {:>9}  {:>9}  {:>9}  {:>9}  {:>10}", "kind", "moved", "carried", "added",
                                    "left out", "bytes")) +
                '\n');
    for (std::size_t i = 0; i < attached.streams.size(); ++i) {
        const EditedStream& stream = edited_.streams[i];
        const RetimedCounts& counts = stream.counts;
        const std::string name = metaDataKindName(stream.source.type);
        if (stream.isCopied)
            writeOutput(fmt::format("  {:<23}  {:>42}  {:>10}\n", name, "copied", attached.streams[i].bytes));
        else
            writeOutput(fmt::format("  {:<23}  {:>9}  {:>9}  {:>9}  {:>9}  {:>10}\n", name, counts.moved,
                                    counts.carried, counts.added, counts.leftOut, attached.streams[i].bytes));
    }
}

Json RetimedStreams::documents(const AttachResult& attached) const {
    Json documents = Json::array();
    for (std::size_t i = 0; i < attached.streams.size(); ++i) {
        const EditedStream& stream = edited_.streams[i];
        documents.push_back({{"kind", kindDocument(stream.source.type)},
                             {"uuid", uuidText(stream.source.type)},
                             {"copied", stream.isCopied},
                             {"entries", attached.streams[i].entries},
                             {"moved", stream.counts.moved},
                             {"carried", stream.counts.carried},
                             {"added", stream.counts.added},
                             {"left_out", stream.counts.leftOut},
                             {"offset", attached.streams[i].offset},
                             {"bytes", attached.streams[i].bytes}});
    }
    return documents;
}

void warnOfOtherLength(const std::string& movie, std::optional<double> duration, const EditList& edits) {
    const double length = edits.duration().nearest();
    if (duration && std::abs(*duration - length) > s_mostDifference)
        warn(fmt::format("{}: is {:.3f} s long, but the pieces are {:.3f} s long together; was it made with other "
                         "pieces?",
                         movie, *duration, length));
}

} // namespace Zulm
