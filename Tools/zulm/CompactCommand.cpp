// The commands that write a recording anew with less metadata: compact and detach.

#include "Platform/DurableFile.h"
#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/SaveTarget.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataBridge/Source/RecordingCompaction.h"

#include <fmt/core.h>

#include <filesystem>
#include <memory>
#include <optional>
#include <system_error>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct TailOptions {
    SaveOptions save;
    KeptMetaData kept = KeptMetaData::Newest;
    bool json = false;

    const char* command() const { return kept == KeptMetaData::Newest ? "compact" : "detach"; }
    const std::string& name() const { return save.inPlace ? save.movie : save.output; }
};

/// Keeps other programs of this library from changing a movie while its copy is made.
std::optional<DurableFile> lockOf(const TailOptions& options) {
    if (!options.save.inPlace)
        return std::nullopt;
    try {
        return std::optional<DurableFile>(std::in_place, options.save.movie);
    } catch (const std::system_error& error) {
        throw Failure(fmt::format("{}: {}; nothing was changed", options.save.movie, error.what()));
    }
}

/// A file in place of a link's target leaves the link alone.
std::unique_ptr<OutputFile> outputFor(const TailOptions& options) {
    if (options.save.inPlace)
        return std::make_unique<OutputFile>(std::filesystem::canonical(options.save.movie).string(),
                                            std::vector<std::string>{}, true);
    return std::make_unique<OutputFile>(options.save.output, std::vector<std::string>{options.save.movie},
                                        options.save.force);
}

Json streamDocument(const StreamInfo& stream) {
    return {{"kind", kindDocument(stream.type)}, {"uuid", uuidText(stream.type)}, {"bytes", stream.presentBytes}};
}

Json fileDocument(const TailOptions& options, const RecordingCompaction& done, std::uint64_t sizeBefore) {
    Json file = fileHeader(options.save.movie);
    addText(file, "output", options.name());
    file.update(Json{{"bytes_before", sizeBefore},
                     {"bytes_after", done.sizeAfter()},
                     {"streams_left_out", done.streamsLeftOut()},
                     {"creators_left_out", done.creatorsLeftOut()},
                     {"streams", Json::array()}});
    for (const StreamInfo& stream : done.streams())
        file["streams"].push_back(streamDocument(stream));
    return file;
}

void print(const TailOptions& options, const RecordingCompaction& done, std::uint64_t sizeBefore) {
    writeOutput(fmt::format("{}: {} stream{} left out, {} kept; {} bytes became {}\n", shown(options.name()),
                            done.streamsLeftOut(), done.streamsLeftOut() == 1 ? "" : "s", done.streams().size(),
                            sizeBefore, done.sizeAfter()));
}

/// What a person can do about it.
std::string hintFor(CompactionError::Reason reason, const std::string& name) {
    using Reason = CompactionError::Reason;
    switch (reason) {
    case Reason::Repairable: return fmt::format("; 'zulm repair {} -o OUT' mends it first", shellWord(name));
    case Reason::Damaged:
        return fmt::format("; 'zulm salvage {} -o DIR' searches it for metadata streams", shellWord(name));
    case Reason::UnreachableStream: return fmt::format("; 'zulm salvage {} -o DIR' writes them out", shellWord(name));
    default: return {};
    }
}

ExitCode writeCopy(const TailOptions& options, RecordingFile& recording, RunReport& report) {
    RecordingCompaction compaction(recording, options.kept);
    if (compaction.streams().size() + compaction.streamsLeftOut() + compaction.creatorsLeftOut() == 0)
        return complainAboutNothing(recording, {});
    const std::unique_ptr<OutputFile> output = outputFor(options);
    output->copyFrom(recording.path(), 0, compaction.copiedBytes());
    compaction.complete(output->temporaryPath());
    output->commit();
    if (report.isWanted())
        report.add(fileDocument(options, compaction, recording.size()));
    else if (!settings().quiet)
        print(options, compaction, recording.size());
    if (compaction.bytesCut() == 0)
        return ExitFine;
    complain(fmt::format("{}: left out {} bytes of incomplete entries", options.name(), compaction.bytesCut()));
    return ExitDamaged;
}

ExitCode writeTail(const TailOptions& options, RunReport& report) {
    const std::optional<DurableFile> lock = lockOf(options);
    const InputFile input(options.save.movie);
    RecordingFile recording = input.open();
    if (!options.save.inPlace)
        requireOutputName(options.save.output, recording.container(), input.path());
    try {
        return writeCopy(options, recording, report);
    } catch (const CompactionError& error) {
        const bool isAboutCopy = error.reason() == CompactionError::Reason::CannotWrite;
        throw Failure(fmt::format("{}: {}{}", isAboutCopy ? options.name() : recording.name(), error.what(),
                                  hintFor(error.reason(), recording.name())));
    }
}

CLI::App* addTailCommand(CLI::App& app, Action& chosen, KeptMetaData kept, const std::string& description) {
    auto options = std::make_shared<TailOptions>();
    options->kept = kept;
    CLI::App* command = app.add_subcommand(options->command(), description);
    command->add_option("FILE", options->save.movie, "A movie or RIFF file; - is standard input")->required();
    addDestinationOptions(*command, options->save, "FILE");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->callback([options, &chosen] {
        requireDestination(options->save);
        if (options->save.inPlace && options->save.movie == "-")
            throw CLI::ValidationError("--in-place: standard input cannot be changed; name a file, or use -o OUT");
        chosen = reporting(options->command(), options->json, {options->save.movie},
                           [options](RunReport& report) { return writeTail(*options, report); });
    });
    return command;
}

} // namespace

void addCompactCommand(CLI::App& app, Action& chosen) {
    addTailCommand(
        app, chosen, KeptMetaData::Newest,
        "Write a recording anew without the streams that later ones have superseded, and without other unused "
        "bytes of its metadata. All that readers find stays")
        ->footer("zulm compact Recording.mp4 --in-place\nzulm compact Recording.mp4 -o Smaller.mp4");
}

void addDetachCommand(CLI::App& app, Action& chosen) {
    addTailCommand(app, chosen, KeptMetaData::Nothing,
                   "Write a recording anew without any metadata: all streams and the recording info go, and the movie "
                   "becomes what it was before they were attached")
        ->footer("zulm detach Recording.mp4 -o Movie.mp4\n"
                 "zulm extract Recording.mp4 -o streams && zulm detach Recording.mp4 --in-place");
}

} // namespace Zulm
