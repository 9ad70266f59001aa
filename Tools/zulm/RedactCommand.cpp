#include "Tools/zulm/HeldStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Number.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RedactedCopy.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <cmath>
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
    bool keys = false;
    std::string titles;
    std::optional<TimeRange> range;
    bool force = false;
    bool json = false;
};

double secondsIn(const std::string& text, double open) {
    if (text.empty())
        return open;
    const std::optional<double> seconds = realNumber(text);
    if (!seconds || std::isnan(*seconds))
        throw CLI::ValidationError(fmt::format("--range: {} is no number of seconds", text));
    return *seconds;
}

/// "10:20", ":20" or "10:".
TimeRange rangeIn(const std::string& text) {
    constexpr double endless = std::numeric_limits<double>::infinity();
    const std::size_t colon = text.find(':');
    if (colon == std::string::npos || text.size() == 1)
        throw CLI::ValidationError(fmt::format("--range: {} is not of the form A:B, A: or :B", text));
    const TimeRange range{secondsIn(text.substr(0, colon), -endless), secondsIn(text.substr(colon + 1), endless)};
    if (range.from > range.to)
        throw CLI::ValidationError(fmt::format("--range: {} ends before it begins", text));
    return range;
}

Redaction redactionFor(const RedactOptions& options) {
    Redaction redaction;
    for (const std::string& kind : options.removedKinds)
        redaction.removedKinds.insert(typeNamed(kind));
    redaction.clearsKeys = options.keys;
    redaction.removedTimes = options.range;
    if (!options.titles.empty())
        redaction.hidesText = [pattern = std::make_shared<TextPattern>(options.titles, false, false)](
                                  const std::string& text) { return pattern->matches(validText(text)); };
    return redaction;
}

void requireSameContainer(const InputFile& input, const std::string& output) {
    if (MetaDataParser::streamTypeOf(input.path()) != MetaDataParser::streamTypeOf(output))
        throw Failure(fmt::format("{}: not named as {} is; the extension tells the container", output, input.name()));
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
            {"bytes_left_out", stream.bytesLeftOut}};
}

void report(const RedactOptions& options, const RedactedCopy& copy) {
    Json document = fileHeader(options.file);
    document["output"] = validText(options.output);
    document["streams"] = Json::array();
    for (const RedactedStream& stream : copy.streams())
        document["streams"].push_back(streamDocument(stream));
    document["unreachable_streams"] = copy.unreachableStreams();
    printReport("redact", Json::array({document}));
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

ExitCode runRedact(const RedactOptions& options) {
    const InputFile input(options.file);
    requireSameContainer(input, options.output);
    Recording recording(input.path(), input.name());
    if (heldStreams(recording).empty())
        return complainAboutNothing(recording, {});
    const Redaction redaction = redactionFor(options);
    OutputFile output(options.output, {input.path()}, options.force);
    RedactedCopy copy(recording, redaction);
    copy.write(output.temporaryPath(), options.output);
    const bool isEmptyStream = recording.parser().getStreamType() == MetaDataParser::RawStream &&
                               copy.streams().front().removal != RedactedStream::Kept;
    if (isEmptyStream)
        throw Failure(fmt::format("{}: nothing would be left of it ({}); nothing was written", input.name(),
                                  removalText(copy.streams().front().removal)));
    const ExitCode damage = complainAboutDamage(output.temporaryPath(), options.output);
    output.commit();
    if (options.json)
        report(options, copy);
    else
        print(options, copy);
    return worseOf(damage, complainAboutWhatIsLeftOut(input.name(), copy));
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
    addStreamOption(*command, options->removedKinds, "Remove this kind, such as cpuUsage, or UUID (repeatable)",
                    "--streams")
        ->allow_extra_args();
    command->add_flag("--keys", options->keys,
                      "Make every keystroke character code 0 without modifiers; their times stay");
    command
        ->add_option("--titles", options->titles,
                     "Make every title, slide text, comment and application name in which this (RE2) is found an "
                     "ellipsis")
        ->type_name("REGEX");
    command
        ->add_option_function<std::string>(
            "--range", [options](const std::string& text) { options->range = rangeIn(text); },
            "Remove the entries of all streams from A to B seconds; A or B may be missing")
        ->type_name("A:B");
    command->add_flag("--force", options->force, "Replace OUT where it exists");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm redact Recording.mp4 -o Public.mp4 --keys --titles '(?i)salary|secret'\n"
                    "zulm redact Recording.mp4 -o Public.mp4 --streams systemData keyboardAction --range 12.5:40");
    command->callback([options, &chosen] {
        if (options->removedKinds.empty() && !options->keys && options->titles.empty() && !options->range)
            throw CLI::RequiredError("at least one of --streams, --keys, --titles and --range");
        if (!options->titles.empty())
            const TextPattern checked(options->titles, false, false);
        chosen = [options] { return runRedact(*options); };
    });
}

} // namespace Zulm
