#include "Tools/zulm/Choice.h"
#include "Tools/zulm/HeldStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RedactedCopy.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <optional>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct RedactOptions {
    std::string file;
    std::string output;
    std::vector<std::string> removedKinds;
    std::vector<std::string> keptKinds;
    bool keys = false;
    std::vector<std::string> titles;
    std::vector<TimeRange> ranges;
    bool force = false;
    bool json = false;
};

double secondsIn(const std::string& text, double open) {
    if (text.empty())
        return open;
    return requireSeconds("--range", text, Sign::Any);
}

/// "10:20", ":20", "10:", and the same with "..", which lets both ends be time codes.
TimeRange rangeIn(const std::string& text) {
    constexpr double endless = std::numeric_limits<double>::infinity();
    const std::size_t dots = text.find("..");
    const std::size_t middle = dots == std::string::npos ? text.find(':') : dots;
    const std::size_t width = dots == std::string::npos ? 1 : 2;
    if (middle == std::string::npos || text.size() == width)
        throw CLI::ValidationError(fmt::format("--range: {} is not of the form A:B, A: or :B, or A..B", text));
    const TimeRange range{secondsIn(text.substr(0, middle), -endless), secondsIn(text.substr(middle + width), endless)};
    if (range.from > range.to)
        throw CLI::ValidationError(fmt::format("--range: {} ends before it begins", text));
    return range;
}

std::vector<TextPattern> patternsIn(const RedactOptions& options) {
    std::vector<TextPattern> patterns;
    for (const std::string& title : options.titles)
        patterns.emplace_back(title, false, false);
    return patterns;
}

Redaction redactionFor(const RedactOptions& options) {
    Redaction redaction;
    for (const std::string& kind : options.removedKinds)
        redaction.removedKinds.insert(typeNamed(kind));
    for (const std::string& kind : options.keptKinds)
        redaction.keptKinds.insert(typeNamed(kind));
    redaction.clearsKeys = options.keys;
    redaction.removedTimes = options.ranges;
    if (!options.titles.empty())
        redaction.hidesText =
            [patterns = std::make_shared<std::vector<TextPattern>>(patternsIn(options))](const std::string& text) {
                return std::any_of(patterns->begin(), patterns->end(),
                                   [valid = validText(text)](const auto& pattern) { return pattern.matches(valid); });
            };
    return redaction;
}

const char* removalText(RedactedStream::Removal removal) {
    switch (removal) {
    case RedactedStream::Kept: return "kept";
    case RedactedStream::Asked: return "removed";
    case RedactedStream::Undecodable: return "removed: its entries cannot be looked into";
    default: return "removed: it has no whole header";
    }
}

bool isLoss(const RedactedStream& stream) {
    return stream.bytesLeftOut > 0 ||
           (stream.removal != RedactedStream::Kept && stream.removal != RedactedStream::Asked);
}

ExitCode complainAboutWhatIsLeftOut(const std::string& name, const RedactedCopy& copy) {
    ExitCode code = ExitFine;
    for (const RedactedStream& stream : copy.streams()) {
        if (!isLoss(stream))
            continue;
        code = ExitDamaged;
        if (stream.bytesLeftOut > 0)
            complain(fmt::format("{}: {}: left out {} bytes behind its last whole entry", name,
                                 metaDataKindName(stream.header.uuid), stream.bytesLeftOut));
        else
            complain(
                fmt::format("{}: {}: {}", name, metaDataKindName(stream.header.uuid), removalText(stream.removal)));
    }
    if (copy.unreachableStreams() == 0)
        return code;
    complain(fmt::format("{}: left out {} streams that readers do not find; 'zulm salvage {} -o DIR' writes them out",
                         name, copy.unreachableStreams(), shellWord(name)));
    return ExitDamaged;
}

ExitCode complainAboutDamage(const std::string& path, const std::string& output) {
    Recording copy(path, output);
    if (!copy.validation().isDamaged())
        return ExitFine;
    complain(fmt::format("{}: what was damaged in the input still is in the copy; 'zulm verify {}' says what", output,
                         shellWord(output)));
    return ExitDamaged;
}

Json streamDocument(const RedactedStream& stream) {
    return {{"kind", kindDocument(stream.header.uuid)},
            {"uuid", uuidText(stream.header.uuid)},
            {"removed", stream.removal != RedactedStream::Kept},
            {"status", removalText(stream.removal)},
            {"entries", stream.entries},
            {"entries_changed", stream.entriesChanged},
            {"entries_removed", stream.entriesRemoved},
            {"entries_added", stream.entriesAdded},
            {"bytes_left_out", stream.bytesLeftOut}};
}

Json fileDocument(const RedactOptions& options, const RedactedCopy& copy) {
    Json document = fileHeader(options.file);
    addText(document, "output", options.output);
    document["streams"] = Json::array();
    for (const RedactedStream& stream : copy.streams())
        document["streams"].push_back(streamDocument(stream));
    document["unreachable_streams"] = copy.unreachableStreams();
    return document;
}

void print(const RedactOptions& options, const RedactedCopy& copy) {
    writeOutput(fmt::format("{}: written\n", options.output));
    for (const RedactedStream& stream : copy.streams()) {
        const std::string name = metaDataKindName(stream.header.uuid);
        if (stream.removal != RedactedStream::Kept)
            writeOutput(fmt::format("  {:<23}  {}\n", name, removalText(stream.removal)));
        else
            writeOutput(fmt::format("  {:<23}  {} left, {} of them changed; {} removed\n", name, stream.entries,
                                    stream.entriesChanged, stream.entriesRemoved));
    }
}

ExitCode redact(const RedactOptions& options, RunReport& report) {
    const InputFile input(options.file);
    Recording recording(input.path(), input.name());
    requireOutputName(options.output, recording.parser().getStreamType(), input.path());
    if (heldStreams(recording).empty())
        return complainAboutNothing(recording, {});
    const Redaction redaction = redactionFor(options);
    OutputFile output(options.output, {input.name()}, options.force);
    RedactedCopy copy(recording, redaction);
    copy.write(output.temporaryPath(), options.output);
    const bool isEmptyStream = recording.parser().getStreamType() == MetaDataParser::RawStream &&
                               copy.streams().front().removal != RedactedStream::Kept;
    if (isEmptyStream)
        throw Failure(fmt::format("{}: nothing would be left of it ({}); nothing was written", input.name(),
                                  removalText(copy.streams().front().removal)));
    const ExitCode damage = complainAboutDamage(output.temporaryPath(), options.output);
    output.commit();
    if (report.isWanted())
        report.add(fileDocument(options, copy));
    else if (!settings().quiet)
        print(options, copy);
    return worseOf(damage, complainAboutWhatIsLeftOut(input.name(), copy));
}

ExitCode runRedact(const RedactOptions& options) {
    return withReport("redact", options.json, {options.file, options.output},
                      [&](RunReport& report) { return redact(options, report); });
}

} // namespace

void addRedactCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<RedactOptions>();
    CLI::App* command = app.add_subcommand(
        "redact", "Copy a recording without what nobody else should see. What is removed is nowhere in the copy's "
                  "metadata; pictures and sound are copied as they are");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file; - is standard input")->required();
    command->add_option("-o,--output", options->output, "The copy, of the same container")
        ->type_name("OUT")
        ->required();
    addStreamOption(*command, options->removedKinds, "Remove this kind, such as cpuUsage, or UUID (repeatable)");
    addStreamOption(*command, options->keptKinds, "Remove all kinds except this one (repeatable)", "--keep-only");
    command->add_flag("--keys", options->keys,
                      "Make every keystroke character code 0 without modifiers; their times stay");
    command
        ->add_option("--titles", options->titles,
                     "Make every title, slide text, comment and application name in which this (RE2) is found an "
                     "ellipsis")
        ->type_name("REGEX")
        ->allow_extra_args(false);
    command
        ->add_option_function<std::vector<std::string>>(
            "--range",
            [options](const std::vector<std::string>& texts) {
                for (const std::string& text : texts)
                    options->ranges.push_back(rangeIn(text));
            },
            "Remove the entries of all streams from A to B seconds; A or B may be missing. A text that holds inside is "
            "hidden wherever it is recorded (repeatable)")
        ->type_name("A:B")
        ->allow_extra_args(false);
    command->add_flag("--force", options->force, "Replace OUT where it exists");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm redact Recording.mp4 -o Public.mp4 --keys --titles '(?i)salary|secret'\n"
                    "zulm redact Recording.mp4 -o Public.mp4 --stream systemData --range 12.5:40 --range 60:");
    command->callback([options, &chosen] {
        if (options->removedKinds.empty() && options->keptKinds.empty() && !options->keys && options->titles.empty() &&
            options->ranges.empty())
            throw CLI::RequiredError("at least one of --stream, --keep-only, --keys, --titles and --range");
        patternsIn(*options);
        chosen = [options] { return runRedact(*options); };
    });
}

} // namespace Zulm
