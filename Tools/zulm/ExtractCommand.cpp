#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct ExtractOptions {
    std::string file;
    std::string folder;
    std::vector<std::string> kinds;
    bool force = false;
    bool json = false;
};

ExitCode complainAboutCut(const std::string& file, const StreamInfo& stream) {
    if (!stream.isCutShort())
        return ExitFine;
    complain(fmt::format("{}: {} at offset {} declares {} bytes, of which {} are there; 'zulm salvage {} -o DIR' may "
                         "find more",
                         file, stream.name(), stream.offset, stream.declaredBytes, stream.presentBytes,
                         shellWord(file)));
    return ExitDamaged;
}

Json streamDocument(const StreamInfo& stream, const std::string& output) {
    Json document{{"kind", kindDocument(stream.type)},
                  {"uuid", uuidText(stream.type)},
                  {"offset", stream.offset},
                  {"bytes", stream.presentBytes},
                  {"declared_bytes", stream.declaredBytes}};
    addText(document, "file", output);
    return document;
}

ExitCode extract(const ExtractOptions& options, RunReport& report) {
    const InputFile input(options.file);
    RecordingFile recording = input.open();
    const std::vector<StreamInfo> streams = chosenStreams(recording, options.kinds);
    if (streams.empty())
        return complainAboutNothing(recording, options.kinds);
    createFolder(options.folder);
    std::vector<std::string> outputs;
    outputs.reserve(streams.size());
    for (const StreamInfo& stream : streams)
        outputs.push_back(streamFileIn(options.folder, stream.type));
    requireFree(outputs, options.force);
    if (report.isWanted())
        report.beginFile(input.name()).beginArray("streams");
    ExitCode worst = ExitFine;
    for (std::size_t i = 0; i < streams.size(); ++i) {
        writePart(input, streams[i].offset, streams[i].presentBytes, outputs[i], options.force);
        worst = worseOf(worst, complainAboutCut(input.name(), streams[i]));
        if (report.isWanted())
            report.writer().element(streamDocument(streams[i], outputs[i]));
        else if (!settings().quiet)
            writeOutput(fmt::format("{}: {} bytes\n", shown(outputs[i]), streams[i].presentBytes));
    }
    return worst;
}

} // namespace

void addExtractCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<ExtractOptions>();
    CLI::App* command = app.add_subcommand("extract", "Write each stream of a file as a stream file, byte for byte");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file; - is standard input")->required();
    command
        ->add_option("-o,--output", options->folder,
                     "The folder for the stream files. A file is called KIND.dat, or UUID.dat if its kind is unknown")
        ->type_name("DIR")
        ->required();
    addStreamOption(*command, options->kinds,
                    "Write only this kind, such as cursorLocation, or this UUID (repeatable)");
    command->add_flag("--force", options->force, "Replace files that exist already");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm extract Recording.mp4 -o streams\n"
                    "zulm extract Recording.mp4 -o streams --stream keyboardAction");
    command->callback([options, &chosen] {
        chosen = reporting("extract", options->json, {options->file},
                           [options](RunReport& report) { return extract(*options, report); });
    });
}

} // namespace Zulm
