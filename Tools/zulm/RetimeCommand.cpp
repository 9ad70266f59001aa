#include "Reports/Text.h"
#include "Tools/zulm/EditOptions.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RetimedStreams.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/SaveTarget.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataBridge/Source/RecordingCompaction.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <filesystem>
#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct RetimeOptions {
    std::string recording;
    std::string movie;
    EditOptions edits;
    std::string output;
    SafeMovieSave::FragmentIndex index = SafeMovieSave::FragmentIndex::Leave;
    bool replace = false;
    bool force = false;
    bool json = false;
};

/// The edited movie, which must be one that streams can be attached to.
class EditedMovie {
public:
    explicit EditedMovie(const RetimeOptions& options) : options_(options), movie_(openRecording(options.movie)) {
        if (movie_.container() != Container::QuickTime)
            throw Failure(fmt::format("{}: is a {}, not a movie (MP4 or QuickTime)", options.movie,
                                      containerName(movie_.container())));
        const RepairPlan plan = planSave(movie_.bytes(), options.movie);
        if (plan.state == RepairPlan::Unrepairable)
            throw Failure(unrepairableText(options.movie, plan));
        requireReplacement();
    }

    std::optional<double> duration() const { return movie_.duration(); }

    /// Without its streams if they are to be replaced.
    void copyTo(OutputFile& output) {
        if (!hasStreams()) {
            output.copyFrom(options_.movie);
            return;
        }
        try {
            RecordingCompaction compaction(movie_, KeptMetaData::Creators);
            output.copyFrom(options_.movie, 0, compaction.copiedBytes());
            compaction.complete(output.temporaryPath());
        } catch (const CompactionError& error) {
            const bool isRepairable = error.reason() == CompactionError::Reason::Repairable;
            throw Failure(fmt::format(
                "{}: {}{}", options_.movie, error.what(),
                isRepairable ? fmt::format("; 'zulm repair {} -o OUT' mends it first", shellWord(options_.movie))
                             : ""));
        }
    }

private:
    bool hasStreams() const { return !movie_.streams().empty(); }

    void requireReplacement() const {
        if (!hasStreams() || options_.replace)
            return;
        std::vector<std::string> names;
        for (const StreamInfo& stream : movie_.streams())
            names.push_back(stream.name());
        throw Failure(fmt::format("{}: has metadata already: {}; --replace leaves it out. Nothing was written",
                                  options_.movie, fmt::join(names, ", ")));
    }

    const RetimeOptions& options_;
    RecordingFile movie_;
};

Json fileDocument(const RetimeOptions& options, const EditList& edits, const RetimedStreams& streams,
                  const AttachResult& attached) {
    Json file = fileHeader(options.recording);
    addText(file, "movie", options.movie);
    addText(file, "output", options.output);
    file.update(Json{{"pieces", edits.pieces().size()},
                     {"duration", numberDocument(edits.duration().nearest())},
                     {"repair", repairDocument(attached.repair)},
                     {"fragment_index", fragmentIndexText(attached.fragmentIndex)},
                     {"streams", streams.documents(attached)}});
    return file;
}

void print(const RetimeOptions& options, const RetimedStreams& streams, const AttachResult& attached) {
    printRepair(options.output, attached.repair);
    writeOutput(fmt::format("{}: a copy of {} with {} stream{} of {}\n", shown(options.output), shown(options.movie),
                            attached.streams.size(), attached.streams.size() == 1 ? "" : "s",
                            shown(options.recording)));
    streams.print(attached);
}

ExitCode retimeRecording(const RetimeOptions& options, RunReport& report) {
    const InputFile input(options.recording);
    const Recording recording = input.openSession();
    const EditList edits = editsOf(options.edits, recording);
    if (recording.streams().empty())
        return complainAboutNoStreams(recording);
    EditedMovie movie(options);
    requireOutputName(options.output, Container::QuickTime, options.movie);
    OutputFile output(options.output, {options.movie, options.recording, options.edits.file}, options.force);
    const RetimedStreams streams(recording, edits, std::filesystem::path(options.output).parent_path().string());
    movie.copyTo(output);
    const AttachResult attached = streams.attachTo(output.temporaryPath(), options.output, options.index);
    output.commit();
    warnOfOtherLength(options.movie, movie.duration(), edits);
    if (report.isWanted())
        report.add(fileDocument(options, edits, streams, attached));
    else if (!settings().quiet)
        print(options, streams, attached);
    warnOfFragmentIndex(options.output, attached.fragmentIndex);
    return worseOf(streams.complain(), complainAboutLoss(options.output, attached.repair));
}

} // namespace

void addRetimeCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<RetimeOptions>();
    CLI::App* command = app.add_subcommand(
        "retime", "Put a recording's metadata into a movie that was cut out of it, at the new times");
    command->add_option("RECORDING", options->recording, "The recording that was cut; - is standard input")->required();
    command->add_option("--movie", options->movie, "The movie that was cut out of RECORDING")
        ->type_name("EDITED")
        ->required();
    addEditOptions(*command, options->edits);
    command->add_option("-o,--output", options->output, "Write a copy of EDITED with the metadata to this file")
        ->type_name("OUT")
        ->required();
    command->add_flag("--force", options->force, "Replace OUT if it exists");
    command->add_flag("--replace", options->replace, "Leave out the metadata that EDITED has, except who made it");
    addFragmentIndexOption(*command, options->index);
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm retime Recording.mp4 --movie Cut.mp4 --keep 10-25 --keep 40-1:30@2 -o Whole.mp4\n"
                    "zulm retime Recording.mp4 --movie Cut.mp4 --edits Project.llc -o Whole.mp4");
    command->callback([options, &chosen] {
        requireEdits(options->edits, options->recording);
        chosen = reporting("retime", options->json,
                           {options->recording, options->movie, options->output, options->edits.file},
                           [options](RunReport& report) { return retimeRecording(*options, report); });
    });
}

} // namespace Zulm
