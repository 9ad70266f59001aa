#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/NormalForm.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/RedactReport.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/SaveTarget.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <algorithm>
#include <limits>
#include <memory>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct RedactOptions {
    std::string file;
    std::string output;
    std::vector<std::string> removedKinds;
    std::vector<std::string> keptKinds;
    std::vector<std::string> titles;
    RecordingRedaction redaction; ///< what the other options say of it
    bool dryRun = false;
    bool force = false;
    bool json = false;
};

double secondsIn(const std::string& text, double open) {
    if (text.empty())
        return open;
    return requireSeconds("--range", text, Sign::Any);
}

/// "10:20", ":20", "10:", and the same with "..", which lets both ends be time codes. With a colon between them, time
/// codes could be read in two ways.
TimeRange rangeIn(const std::string& text) {
    constexpr double endless = std::numeric_limits<double>::infinity();
    const std::size_t dots = text.find("..");
    const std::size_t middle = dots == std::string::npos ? text.find(':') : dots;
    const std::size_t width = dots == std::string::npos ? 1 : 2;
    const bool isAmbiguous = dots == std::string::npos && std::count(text.begin(), text.end(), ':') > 1;
    if (middle == std::string::npos || text.size() == width || isAmbiguous)
        throw CLI::ValidationError(
            fmt::format("--range: {} is not of the form A:B, A: or :B, nor A..B, which time codes need", text));
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

std::set<uuid> typesNamed(const std::vector<std::string>& kinds) {
    std::set<uuid> types;
    for (const std::string& kind : kinds)
        types.insert(typeNamed(kind));
    return types;
}

RecordingRedaction redactionFor(const RedactOptions& options) {
    RecordingRedaction redaction = options.redaction;
    redaction.streams.removedKinds = typesNamed(options.removedKinds);
    redaction.streams.keptKinds = typesNamed(options.keptKinds);
    if (!options.titles.empty())
        redaction.streams.hidesText =
            [patterns = std::make_shared<std::vector<TextPattern>>(patternsIn(options))](const std::string& text) {
                return std::any_of(patterns->begin(), patterns->end(),
                                   [valid = validText(text)](const auto& pattern) { return pattern.matches(valid); });
            };
    redaction.spellings = [](const std::string& text) { return std::vector{composed(text), decomposed(text)}; };
    return redaction;
}

ExitCode complainAboutWhatIsLeftOut(const std::string& name, const RedactedRecording& recording) {
    ExitCode code = ExitFine;
    for (const RedactedStream& stream : recording.streams) {
        std::string loss;
        if (stream.bytesLeftOut > 0)
            loss = fmt::format("left out {} bytes after its last whole entry", stream.bytesLeftOut);
        else if (stream.removal != RedactedStream::Kept && stream.removal != RedactedStream::Asked)
            loss = removalText(stream.removal);
        if (loss.empty())
            continue;
        complain(fmt::format("{}: {}: {}", name, metaDataKindName(stream.header.uuid), loss));
        code = ExitDamaged;
    }
    if (recording.unreachableStreams == 0)
        return code;
    complain(fmt::format("{}: left out {} streams that readers do not find; 'zulm salvage {} -o DIR' writes them out",
                         name, recording.unreachableStreams, shellWord(name)));
    return ExitDamaged;
}

ExitCode complainAboutDamage(const std::string& path, const std::string& output) {
    RecordingFile copy = openRecording(path, output);
    if (!copy.validation().isDamaged())
        return ExitFine;
    complain(fmt::format("{}: what was damaged in the input still is in the copy; 'zulm verify {}' says what", output,
                         shellWord(output)));
    return ExitDamaged;
}

/// What a person can do about it.
std::string hintFor(RedactionError::Reason reason, const std::string& name) {
    using Reason = RedactionError::Reason;
    switch (reason) {
    case Reason::Repairable: return fmt::format("; run 'zulm repair {} -o OUT' first", shellWord(name));
    case Reason::Damaged:
        return fmt::format("; 'zulm salvage {} -o DIR' writes out its streams, which can be redacted one by one",
                           shellWord(name));
    case Reason::MisplacedStream:
        return fmt::format(
            "; --blank-unknown removes it from free space, and 'zulm salvage {} -o DIR' shows what it is",
            shellWord(name));
    case Reason::TextStays: return "; add --chapters, which removes chapters, titles and tags of the movie";
    case Reason::TextCannotGo: return "; zulm cannot remove texts from there: remove that track with another program";
    case Reason::FoundInCopy: return "; nothing was written";
    default: return {};
    }
}

/// Throws `Failure` in place of what the library throws, and names the file that is concerned.
template <class Work>
auto orFailure(const RedactOptions& options, Work work) {
    using Reason = RedactionError::Reason;
    const std::string& name = options.file;
    try {
        return orFileError(name, work);
    } catch (const RedactionError& error) {
        const bool isAboutCopy = error.reason() == Reason::CannotWrite || error.reason() == Reason::FoundInCopy;
        throw Failure(
            fmt::format("{}: {}{}", isAboutCopy ? options.output : name, error.what(), hintFor(error.reason(), name)));
    }
}

/// One line of progress for each step.
RecordingRedactor::Progress progressOf(const RedactOptions& options) {
    using Step = RecordingRedactor::Step;
    struct Shown {
        Step step;
        Progress progress;
    };
    return [&options, shown = std::shared_ptr<Shown>()](Step step, std::uint64_t done, std::uint64_t total) mutable {
        if (!shown || shown->step != step) {
            shown.reset(); // ends the line of the step before
            const std::string what = step == Step::Searching ? "searching " + options.file
                                     : step == Step::Copying ? "copying " + options.file
                                                             : "checking " + options.output;
            shown.reset(new Shown{step, {what, total}});
        }
        shown->progress.moveTo(done);
    };
}

/// The list of a dry run is a result, which --quiet does not hide.
void tell(const RedactOptions& options, const RedactReport& redaction, const VisitEntries& visitEntries,
          RunReport& report) {
    if (report.isWanted())
        writeRedaction(report.writer(), redaction, visitEntries);
    else if (options.dryRun || !settings().quiet)
        printRedaction(redaction, visitEntries);
}

ExitCode preview(const RedactOptions& options, RecordingRedactor& redactor,
                 std::function<void(const RedactedEntry&)>& visit, RunReport& report) {
    const RedactedRecording result = redactor.preview();
    const auto visitEntries = [&](const auto& visitEntry) {
        visit = visitEntry;
        redactor.preview();
    };
    tell(options, {options.file, {}, result}, visitEntries, report);
    return complainAboutWhatIsLeftOut(options.file, result);
}

ExitCode write(const RedactOptions& options, RecordingRedactor& redactor, RunReport& report) {
    OutputFile output(options.output, {options.file}, options.force);
    const RedactedRecording result = redactor.write(output.temporaryPath());
    const ExitCode damage = complainAboutDamage(output.temporaryPath(), options.output);
    output.commit();
    tell(options, {options.file, options.output, result}, {}, report);
    return worseOf(damage, complainAboutWhatIsLeftOut(options.file, result));
}

ExitCode redact(const RedactOptions& options, RunReport& report) {
    const InputFile input(options.file);
    RecordingFile recording = input.open();
    if (!options.dryRun)
        requireOutputName(options.output, recording.container(), input.path());
    RecordingRedaction redaction = redactionFor(options);
    std::function<void(const RedactedEntry&)> visit;
    if (options.dryRun)
        redaction.streams.onEntry = [&visit](const RedactedEntry& entry) {
            if (visit)
                visit(entry);
        };
    return orFailure(options, [&] {
        RecordingRedactor redactor(recording.bytes(), recording.container(), redaction, progressOf(options));
        if (redactor.isEmpty())
            return complainAboutNothing(recording, {});
        return options.dryRun ? preview(options, redactor, visit, report) : write(options, redactor, report);
    });
}

bool removesNothing(const RedactOptions& options) {
    const RecordingRedaction& redaction = options.redaction;
    return options.removedKinds.empty() && options.keptKinds.empty() && options.titles.empty() &&
           !redaction.streams.clearsKeys && redaction.streams.removedTimes.empty() && !redaction.removesChapters &&
           !redaction.removesCreator && !redaction.blanksUnknown;
}

} // namespace

void addRedactCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<RedactOptions>();
    CLI::App* command = app.add_subcommand(
        "redact", "Copy a recording without what nobody else should see. The copy is read back, and does not appear if "
                  "anything that was to go is found in it. Pictures and sound are copied as they are");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file; - is standard input")->required();
    command->add_option("-o,--output", options->output, "The copy, of the same container")->type_name("OUT");
    addStreamOption(*command, options->removedKinds, "Remove this kind, such as cpuUsage, or UUID (repeatable)");
    addStreamOption(*command, options->keptKinds, "Remove all kinds except this one (repeatable)", "--keep-only");
    command->add_flag("--keys", options->redaction.streams.clearsKeys,
                      "Make every keystroke character code 0 without modifiers; their times stay");
    command
        ->add_option("--titles", options->titles,
                     "Make every title, slide text, comment and application name in which this (RE2) is found an "
                     "ellipsis (repeatable)")
        ->type_name("REGEX")
        ->allow_extra_args(false);
    command
        ->add_option_function<std::vector<std::string>>(
            "--range",
            [options](const std::vector<std::string>& texts) {
                for (const std::string& text : texts)
                    options->redaction.streams.removedTimes.push_back(rangeIn(text));
            },
            "Remove the entries of all streams from A to B seconds; A or B may be missing, and A..B takes time codes. "
            "A "
            "text that holds inside is hidden wherever it is recorded (repeatable)")
        ->type_name("A:B")
        ->allow_extra_args(false);
    command->add_flag("--chapters", options->redaction.removesChapters,
                      "Remove chapters, titles, tags and names of tracks from the movie itself. Captions stay");
    command->add_flag("--creator", options->redaction.removesCreator,
                      "Remove the versions of program and system from the recording info");
    command->add_flag("--blank-unknown", options->redaction.blanksUnknown,
                      "Fill free space, and atoms or chunks of unknown types, with zeros");
    command->add_flag("--dry-run", options->dryRun, "Write nothing; list every entry and place that would go");
    command->add_flag("--force", options->force, "Replace OUT if it exists");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm redact Recording.mp4 -o Public.mp4 --keys --titles '(?i)salary|secret'\n"
                    "zulm redact Recording.mp4 -o Public.mp4 --stream systemData --range 12.5:40 --range 60:");
    command->callback([options, &chosen] {
        if (removesNothing(*options))
            throw CLI::RequiredError("at least one of --stream, --keep-only, --keys, --titles, --range, --chapters, "
                                     "--creator and --blank-unknown");
        if (options->output.empty() && !options->dryRun)
            throw CLI::RequiredError("--output or --dry-run");
        patternsIn(*options);
        chosen = reporting("redact", options->json, {options->file, options->output},
                           [options](RunReport& report) { return redact(*options, report); });
    });
}

} // namespace Zulm
