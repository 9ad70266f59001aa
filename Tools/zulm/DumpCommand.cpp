#include "Reports/EntryFormat.h"
#include "Reports/Findings.h"
#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/ManyFiles.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Printout.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <optional>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct DumpOptions {
    ManyFiles files;
    std::vector<std::string> kinds;
    EntryFormat format = EntryFormat::Text;
    std::optional<double> from;
    std::optional<double> to;
    Columns columns;
    std::string imageFolder;
    bool force = false;

    bool covers(double time) const { return (!from || time >= *from) && (!to || time <= *to); }
};

/// Prints the entries of one stream as they are read.
template <class Kind>
class EntryPrinter {
public:
    EntryPrinter(const DumpOptions& options, RecordingFile& recording, Printout& printout, const StreamReport& stream)
        : options_(options), recording_(recording), printout_(printout), stream_(stream) {
        if (!isTerminal(stdout))
            progress_.emplace("reading " + stream.name(), stream.readableBytes);
    }

    void print(double time, const typename Kind::Value& value) {
        ++read_;
        if (progress_ && read_ % 1024 == 0)
            progress_->moveTo(stream_.readableBytes * read_ / std::max(read_, stream_.wholeEntries));
        if (!options_.covers(time))
            return;
        Json entry = entryDocument<Kind>(time, value);
        if (const std::string damage = damageOf(entry); !damage.empty() && !options_.imageFolder.empty())
            warn(fmt::format("{}: {}, entry {}: {}; not written", recording_.name(), stream_.name(), read_, damage));
        if constexpr (std::same_as<typename Kind::Value, CursorImage>)
            writeImage(entry, value);
        printout_.print(entry);
    }

    std::uint64_t read() const { return read_; }

private:
    void writeImage(Json& entry, const CursorImage& cursor) const {
        if (options_.imageFolder.empty() || !entry["image"].is_object() || !damageOf(entry).empty())
            return;
        const std::string_view bytes(reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize);
        const std::string name =
            fmt::format("cursor-{}-entry-{}{}", cursor.uniqueId, read_, isPNG(bytes) ? ".png" : ".tiff");
        const auto file = std::filesystem::path(options_.imageFolder) / name;
        writeWholeFile(file.string(), std::string(bytes), {recording_.name()}, options_.force);
        addText(entry["image"], "file", file.string());
        say(fmt::format("{} written", file.string()));
    }

    static bool isPNG(std::string_view bytes) { return bytes.starts_with("\x89PNG\r\n\x1a\n"); }

    const DumpOptions& options_;
    RecordingFile& recording_;
    Printout& printout_;
    const StreamReport& stream_;
    std::optional<Progress> progress_;
    std::uint64_t read_ = 0;
};

template <class Kind>
void dumpEntries(RecordingFile& recording, const DumpOptions& options, Printout& printout, const StreamReport& stream) {
    EntryPrinter<Kind> printer(options, recording, printout, stream);
    recording.readEntries<typename Kind::Value>(stream, [&printer](double time, const typename Kind::Value& value) {
        printer.print(time, value);
        return true;
    });
    if (const std::string damage = damageIn(stream); !damage.empty())
        warn(fmt::format("{}: {} {}; 'zulm verify {}' says more", recording.name(), stream.name(), damage,
                         shellWord(recording.name())));
    say(fmt::format("{}: {} entries of {} read", recording.name(), printer.read(), stream.name()));
}

ExitCode dumpStream(RecordingFile& recording, const DumpOptions& options, Printout& printout,
                    const StreamReport& stream, bool isOnlyOne) {
    const std::string damage = damageIn(stream);
    bool isShown = true;
    const bool isDecoded =
        isDecodable(stream.header()) && RecordedKinds::visit(stream.type, [&]<class Kind>() {
            const EntryKeys keys = tableKeys<Kind>();
            isShown = options.columns.areIn(keys);
            if (!isShown)
                return say(fmt::format("{}: {} has none of the columns", recording.name(), stream.name()));
            printout.beginStream(stream, &keys, isOnlyOne);
            dumpEntries<Kind>(recording, options, printout, stream);
        });
    if (!isShown)
        return ExitFine;
    if (!isDecoded) {
        printout.beginStream(stream, nullptr, isOnlyOne);
        warn(fmt::format("{}: entries of {}, version {}, cannot be decoded{}", recording.name(), stream.name(),
                         stream.version, damage.empty() ? damage : ": " + damage));
    }
    printout.endStream();
    return damage.empty() ? ExitFine : ExitDamaged;
}

struct StreamsToDump {
    std::vector<StreamInfo> streams;
    std::vector<std::string> missing; ///< names that no stream has
};

/// In the order in which they are named.
StreamsToDump streamsToDump(const std::vector<StreamInfo>& available, const DumpOptions& options) {
    if (available.empty() || options.kinds.empty())
        return {available, {}};
    StreamsToDump chosen;
    const auto find = [](const std::vector<StreamInfo>& streams, const uuid& type) {
        return std::find_if(streams.begin(), streams.end(), [&](const auto& stream) { return stream.type == type; });
    };
    for (const std::string& name : options.kinds) {
        const uuid type = typeNamed(name);
        const auto stream = find(available, type);
        if (stream == available.end())
            chosen.missing.push_back(name);
        else if (find(chosen.streams, type) == chosen.streams.end())
            chosen.streams.push_back(*stream);
    }
    return chosen;
}

ExitCode dumpFile(const std::string& path, const DumpOptions& options, RunReport& report) {
    Printout printout(options.format, options.columns, options.files.areSeveral(),
                      report.isWanted() ? &report.writer() : nullptr);
    const InputFile input(path);
    RecordingFile recording = input.open();
    const std::vector<StreamInfo> available = recording.streams();
    const auto [streams, missing] = streamsToDump(available, options);
    printout.beginFile(recording);
    ExitCode worst = ExitFine;
    for (const StreamInfo& stream : streams)
        worst =
            worseOf(worst, dumpStream(recording, options, printout, recording.examine(stream), streams.size() == 1));
    printout.endFile();
    if (available.empty() || !missing.empty())
        worst = worseOf(worst, complainAboutNothing(recording, missing));
    return worst;
}

ExitCode dump(const DumpOptions& options, RunReport& report) {
    if (!options.imageFolder.empty())
        createFolder(options.imageFolder);
    return workOnFiles(options.files, report,
                       [&options](const std::string& path, RunReport& part) { return dumpFile(path, options, part); });
}

} // namespace

void addDumpCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<DumpOptions>();
    CLI::App* command = app.add_subcommand("dump", "Print the entries of the streams of one or several files");
    addManyFiles(*command, options->files, "Movies, RIFF files or stream files; - is standard input");
    addStreamOption(*command, options->kinds,
                    "Print only this kind, such as cursorLocation, or this UUID (repeatable)");
    addChoice(*command, "--format", options->format,
              "How entries are printed. csv has one table for every stream, with an empty line between two tables",
              {{"text", EntryFormat::Text},
               {"json", EntryFormat::JSON},
               {"ndjson", EntryFormat::NDJSON},
               {"csv", EntryFormat::CSV}});
    command
        ->add_option_function<std::string>(
            "--columns", [options](const std::string& list) { options->columns = Columns(list); },
            "Print only these members of the entries, such as timestamp,x,y, and only the streams that have some of "
            "them. With csv, ndjson and text, stream and file may be among them")
        ->type_name("NAMES");
    addSeconds(*command, "--from", options->from, "Print only entries at this time or later", Sign::Any);
    addSeconds(*command, "--to", options->to, "Print only entries at this time or earlier", Sign::Any);
    command
        ->add_option("--images", options->imageFolder, "Write the cursor images into this folder, as they are stored")
        ->type_name("DIR");
    command->add_flag("--force", options->force, "Replace images that exist already");
    command->footer("zulm dump --stream keyboardAction --from 10 --to 20 Recording.mp4\n"
                    "zulm dump --format csv --stream cursorLocation Recording.mp4 > cursor.csv");
    command->callback([options, &chosen] {
        if (options->from && options->to && *options->from > *options->to)
            throw CLI::ValidationError("--from", fmt::format("{} is later than --to {}", *options->from, *options->to));
        requireFiles(options->files);
        if (!options->imageFolder.empty() && options->files.areSeveral())
            throw CLI::ValidationError("--images", "the images of one FILE can be written at once, not of several");
        chosen = reportingOnMany(
            "dump", options->format == EntryFormat::JSON, options->files,
            [options](RunReport& report) { return dump(*options, report); }, JsonWriter::Style::Lines);
    });
}

} // namespace Zulm
