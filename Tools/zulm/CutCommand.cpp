#include "Reports/Text.h"
#include "Tools/zulm/EditOptions.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/MovieCut.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RetimedStreams.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <filesystem>
#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct CutOptions {
    std::string recording;
    EditOptions edits;
    std::string output;
    CutMode mode = CutMode::Exact;
    bool force = false;
    bool json = false;
};

Json pieceDocument(const EditPiece& piece) {
    if (piece.isHeld())
        return {{"at", piece.start.nearest()}, {"duration", piece.duration.nearest()}};
    return {{"start", piece.start.nearest()}, {"end", piece.end.nearest()}, {"speed", piece.speed.nearest()}};
}

Json fileDocument(const CutOptions& options, const EditList& edits, const RetimedStreams& streams,
                  const AttachResult& attached) {
    Json file = fileHeader(options.recording);
    addText(file, "output", options.output);
    file.update(Json{{"fast", options.mode == CutMode::Fast},
                     {"duration", edits.duration().nearest()},
                     {"pieces", Json::array()},
                     {"streams", streams.documents(attached)}});
    for (const EditPiece& piece : edits.pieces())
        file["pieces"].push_back(pieceDocument(piece));
    return file;
}

void print(const CutOptions& options, const EditList& edits, const RetimedStreams& streams,
           const AttachResult& attached) {
    writeOutput(fmt::format("{}: {:.3f} s in {} piece{} of {}, with {} stream{}\n", shown(options.output),
                            edits.duration().nearest(), edits.pieces().size(), edits.pieces().size() == 1 ? "" : "s",
                            shown(options.recording), attached.streams.size(),
                            attached.streams.size() == 1 ? "" : "s"));
    if (options.mode == CutMode::Fast)
        for (const EditPiece& piece : edits.pieces())
            writeOutput(fmt::format("  from {:.3f} s to {:.3f} s\n", piece.start.nearest(), piece.end.nearest()));
    streams.print(attached);
}

/// Makes the movie. An interruption leaves nothing of it.
EditList madeMovie(const CutOptions& options, const InputFile& input, const EditList& edits, const OutputFile& output) {
    const NotedSignals noted;
    return cutMovie(input, edits, options.mode, output.temporaryPath(), options.output);
}

ExitCode cutRecording(const CutOptions& options, RunReport& report) {
    const InputFile input(options.recording);
    const Recording recording = input.openSession();
    if (recording.container() == Container::RawStream)
        throw Failure(fmt::format("{}: is a stream alone, without a movie that could be cut", options.recording));
    const EditList edits = editsOf(options.edits, recording);
    if (recording.streams().empty())
        return complainAboutNoStreams(recording);
    requireOutputName(options.output, Container::QuickTime, options.recording);
    OutputFile output(options.output, {options.recording, options.edits.file}, options.force);
    const EditList made = madeMovie(options, input, edits, output);
    const RetimedStreams streams(recording, made, std::filesystem::path(options.output).parent_path().string());
    const AttachResult attached = streams.attachTo(output.temporaryPath(), options.output);
    const auto duration = movieDuration(openSource(output.temporaryPath(), options.output), Container::QuickTime);
    output.commit();
    warnOfOtherLength(options.output, duration, made);
    if (report.isWanted())
        report.add(fileDocument(options, made, streams, attached));
    else if (!settings().quiet)
        print(options, made, streams, attached);
    return streams.complain();
}

ExitCode cutOrEnd(const CutOptions& options, RunReport& report) {
    try {
        return cutRecording(options, report);
    } catch (const Interruption& interruption) {
        complain(fmt::format("{}: interrupted; nothing was written", options.output));
        endBy(interruption);
    }
}

} // namespace

void addCutCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<CutOptions>();
    CLI::App* command = app.add_subcommand("cut", "Cut a recording with ffmpeg: its pictures, sound and metadata");
    command->add_option("RECORDING", options->recording, "The recording; - is standard input")->required();
    addEditOptions(*command, options->edits);
    command->add_option("-o,--output", options->output, "Write the new movie to this file")
        ->type_name("OUT")
        ->required();
    command->add_flag("--force", options->force, "Replace OUT if it exists");
    command->add_flag_callback(
        "--fast", [options] { options->mode = CutMode::Fast; },
        "Copy the pictures instead of encoding them again. Every piece then begins at the last key frame before it; "
        "where the pieces begin is printed. Speeds and held frames are not possible");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm cut Recording.mp4 --keep 10-25 --keep 40-1:30@2 -o Cut.mp4\n"
                    "zulm cut Recording.mp4 --remove 5-12.5 --fast -o Cut.mp4");
    command->callback([options, &chosen] {
        requireEdits(options->edits, options->recording);
        chosen = reporting("cut", options->json, {options->recording, options->output, options->edits.file},
                           [options](RunReport& report) { return cutOrEnd(*options, report); });
    });
}

} // namespace Zulm
