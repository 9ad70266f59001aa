#include "Reports/Text.h"
#include "Tools/zulm/AttachTimes.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/SaveTarget.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <filesystem>
#include <set>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct AttachOptions {
    SaveOptions save;
    std::vector<std::string> streams;
    std::string from;
    TimeOptions times;
    bool replace = false;
    SafeMovieSave::FragmentIndex index = SafeMovieSave::FragmentIndex::Leave;
    bool unchecked = false;
    bool json = false;
};

/// What is to be attached, and whether something of it is lost already.
struct Streams {
    std::vector<StreamSource> sources; ///< only stream files are checked
    std::vector<std::string> empty;    ///< stream files that were left out
    std::set<uuid> types;              ///< of the stream files
    ExitCode code = ExitFine;
};

ByteSource openStreamFile(const std::string& path) {
    requireFile(path);
    ByteSource stream = openSource(path, path);
    const RecognizedContainer recognized = recognizeContainer(stream, path);
    if (recognized.type == Container::RawStream)
        return stream;
    if (recognized.type == Container::Unknown)
        throw Failure(fmt::format("{}: not a stream file (.dat): it {}", path, recognized.refusal()));
    throw Failure(
        fmt::format("{}: not a stream file (.dat) but a {}; '--from {}' carries the streams of a recording over", path,
                    containerName(recognized.type), shellWord(path)));
}

void takeStreamFiles(const AttachOptions& options, Streams& streams) {
    for (const std::string& path : options.streams) {
        const ByteSource stream = openStreamFile(path);
        if (stream.size() == 0) {
            complain(fmt::format("{}: is empty, as nothing was recorded into it; it was left out", path));
            streams.empty.push_back(path);
            streams.code = ExitDamaged;
            continue;
        }
        if (const auto header = StreamEntries(stream).header())
            streams.types.insert(header->uuid);
        const StreamSource source = StreamSource::bytes(stream, path);
        streams.sources.push_back(options.unchecked ? source.unchecked() : source);
    }
}

void complainAboutOldMovie(const std::string& path, const std::string& what, Streams& streams) {
    complain(fmt::format("{}: {}; 'zulm salvage {} -o DIR' may find more", path, what, shellWord(path)));
    streams.code = ExitDamaged;
}

void takeStreamsOfOldMovie(const AttachOptions& options, Streams& streams) {
    RecordingFile old = openRecording(options.from);
    for (const StreamInfo& stream : old.streams()) {
        if (options.replace && streams.types.contains(stream.type))
            continue; // a stream file takes its place
        const std::string place = fmt::format("{} at offset {}", stream.name(), stream.offset);
        if (!stream.hasRoom()) {
            complainAboutOldMovie(options.from, place + " lies in an atom without room for it", streams);
            continue;
        }
        if (stream.isCutShort())
            complainAboutOldMovie(options.from,
                                  fmt::format("{} declares {} bytes, {} of which are there", place,
                                              stream.declaredBytes, stream.presentBytes),
                                  streams);
        streams.sources.push_back(
            StreamSource::bytes(old.bytes().part(stream.offset, stream.declaredBytes), options.from).unchecked());
    }
    if (old.validation().hidesStreams())
        complainAboutOldMovie(options.from, "its metadata cannot be walked to the end", streams);
}

Streams takeStreams(const AttachOptions& options) {
    Streams streams;
    takeStreamFiles(options, streams);
    if (!options.from.empty())
        takeStreamsOfOldMovie(options, streams);
    return streams;
}

const char* cutText(StreamExtent::End end) {
    return end == StreamExtent::EmptyEntry ? "an entry of size 0, which no reader gets past" : "an entry is cut short";
}

void print(const std::string& name, const AttachResult& attached) {
    printRepair(name, attached.repair);
    writeOutput(fmt::format("{}: {} stream{} attached\n", shown(name), attached.streams.size(),
                            attached.streams.size() == 1 ? "" : "s"));
    for (const AttachedStream& stream : attached.streams)
        writeOutput(fmt::format("  {:<23}  {:>9} {:<7}  {:>10} bytes\n", metaDataKindName(stream.type), stream.entries,
                                stream.entries == 1 ? "entry" : "entries", stream.bytes));
}

Json streamDocument(const AttachedStream& stream) {
    Json document{{"source", stream.name},         {"kind", kindDocument(stream.type)},
                  {"uuid", uuidText(stream.type)}, {"offset", stream.offset},
                  {"bytes", stream.bytes},         {"entries", stream.entries},
                  {"bytes_cut", stream.bytesCut}};
    if (stream.bytesCut > 0)
        document["cut_because"] = cutText(stream.cutBecause);
    return document;
}

/// How the times of what was attached fit the movie.
struct TimesOutside {
    std::uint64_t left = 0;    ///< entries after the movie's end
    std::uint64_t removed = 0; ///< entries that --trim left out
};

Json fileDocument(const AttachOptions& options, const std::string& name, const AttachResult& attached,
                  const TimesOutside& times, const Streams& streams) {
    Json file = fileHeader(options.save.movie);
    addText(file, "output", name);
    file.update(Json{{"repair", repairDocument(attached.repair)},
                     {"fragment_index", fragmentIndexText(attached.fragmentIndex)},
                     {"entries_after_end", times.left},
                     {"entries_trimmed", times.removed},
                     {"streams", Json::array()}});
    for (const auto& stream : attached.streams)
        file["streams"].push_back(streamDocument(stream));
    for (const std::string& path : streams.empty)
        file["left_out"].push_back(validText(path));
    return file;
}

ExitCode complainAboutCuts(const AttachResult& attached) {
    ExitCode code = ExitFine;
    for (const AttachedStream& stream : attached.streams) {
        if (stream.bytesCut == 0)
            continue;
        complain(fmt::format("{}: {} left out {} byte{} from offset {} of the stream on: {}", stream.name,
                             metaDataKindName(stream.type), stream.bytesCut, stream.bytesCut == 1 ? "" : "s",
                             stream.bytes, cutText(stream.cutBecause)));
        code = ExitDamaged;
    }
    return code;
}

ExitCode complainAboutNothingToAttach(const AttachOptions& options, ExitCode code) {
    if (options.from.empty())
        complain("there is no stream to attach; nothing was written");
    else
        complain(fmt::format("{}: {}; nothing was written", options.from,
                             code == ExitFine ? "no recording metadata in it" : "no stream in it can be carried over"));
    return worseOf(code, ExitNoMetaData);
}

ExitCode attachStreams(const AttachOptions& options, RunReport& report) {
    requireFile(options.save.movie);
    const Streams streams = takeStreams(options);
    if (streams.sources.empty())
        return complainAboutNothingToAttach(options, streams.code);
    std::vector<std::string> inputs = options.streams;
    if (!options.from.empty())
        inputs.push_back(options.from);
    SaveTarget movie(options.save, inputs);
    const auto duration = movieDuration(movie.movie(), Container::QuickTime);
    const std::string folder = std::filesystem::path(movie.name()).parent_path().string();
    const RetimedSources retimed(streams.sources, options.times, duration, folder);
    if (retimed.sources().empty())
        return complainAboutNothingToAttach(options, ExitDamaged);
    const auto existing = options.replace ? ExistingStreams::Supersede : ExistingStreams::Refuse;
    const AttachPlan plan = movie.planned([&](const ByteSource& bytes, const std::string& path) {
        AttachPlan examined(streams.sources, existing);
        if (options.times.changesTimes())
            examined = AttachPlan(retimed.sources(), existing);
        examined.requireFor(bytes, path);
        return examined;
    });
    const AttachResult attached = movie.save(
        "attaching to " + movie.name(), [&](const SafeMovieSave& save) { return save.attach(plan, options.index); });
    const TimesOutside times{warnOfTimesOutside(movie.name(), duration, retimed.sources()), retimed.entriesRemoved()};
    if (report.isWanted())
        report.add(fileDocument(options, movie.name(), attached, times, streams));
    else if (!settings().quiet)
        print(movie.name(), attached);
    warnOfFragmentIndex(movie.name(), attached.fragmentIndex);
    return worseOf(worseOf(streams.code, retimed.complainAboutCuts()),
                   worseOf(complainAboutLoss(movie.name(), attached.repair), complainAboutCuts(attached)));
}

} // namespace

void addAttachCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<AttachOptions>();
    CLI::App* command = app.add_subcommand("attach", "Put stream files, or another movie's streams, into a movie");
    addSaveOptions(*command, options->save);
    command->add_option("STREAM", options->streams, "Stream files (.dat)");
    command->add_option("--from", options->from, "Carry all streams of this recording over")->type_name("OLDMOVIE");
    command->add_flag("--replace", options->replace,
                      "Attach kinds that are there already: a stream file goes before one of OLDMOVIE, and readers "
                      "take the new one before one of MOVIE, which stays in the file unread");
    addTimeOptions(*command, options->times);
    addFragmentIndexOption(*command, options->index);
    command->add_flag("--unchecked", options->unchecked,
                      "Attach a STREAM also if its header names no known kind and version, or if it holds bytes "
                      "but not one whole entry. What --from carries over is never refused for that");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm attach Movie.mp4 cursorLocation.dat slideTitles.dat -o Recording.mp4\n"
                    "zulm attach Remuxed.mp4 --from Recording.mp4 --in-place\n"
                    "zulm attach Cut.mp4 --from Recording.mp4 --shift -12.5 --trim -o Whole.mp4");
    command->callback([options, &chosen] {
        if (options->streams.empty() && options->from.empty())
            throw CLI::RequiredError("at least one STREAM, or --from OLDMOVIE,");
        requireDestination(options->save);
        std::vector<std::string> files{options->save.movie, options->save.output, options->from};
        files.insert(files.end(), options->streams.begin(), options->streams.end());
        chosen = reporting("attach", options->json, files,
                           [options](RunReport& report) { return attachStreams(*options, report); });
    });
}

} // namespace Zulm
