#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataBridge/Source/StreamSalvage.h"

#include <fmt/core.h>

#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct SalvageOptions {
    std::string file;
    std::string folder;
    bool force = false;
    bool json = false;
};

const char* originText(SalvagedStream::Origin origin) {
    switch (origin) {
    case SalvagedStream::Reachable: return "reachable";
    case SalvagedStream::Unreachable: return "behind a broken atom";
    default: return "bare header";
    }
}

SalvageReport search(const std::string& path) {
    return orFileError(path, [&path] {
        const ByteSource file = ByteSource::file(path);
        Progress progress("searching " + path, file.size());
        const Container::Type type = recognizeContainer(file, path).type; // unknown ones are searched, too
        return StreamSalvage(file, type, [&](std::uint64_t done) { progress.moveTo(done); }).run();
    });
}

/// Of each kind the best comes first and gets the plain name.
std::vector<std::string> outputsFor(const std::vector<SalvagedStream>& streams, const std::string& folder) {
    std::vector<std::string> outputs;
    std::size_t number = 0;
    for (std::size_t i = 0; i < streams.size(); ++i) {
        number = i > 0 && streams[i - 1].header.uuid == streams[i].header.uuid ? number + 1 : 1;
        outputs.push_back(streamFileIn(folder, streams[i].header.uuid, number));
    }
    return outputs;
}

Json streamDocument(const SalvagedStream& stream, const std::string& output) {
    Json document{{"kind", kindDocument(stream.header.uuid)},
                  {"uuid", uuidText(stream.header.uuid)},
                  {"version", stream.header.version},
                  {"found", originText(stream.origin)},
                  {"offset", stream.offset},
                  {"bytes", stream.bytes},
                  {"declared_bytes", stream.declaredBytes ? Json(*stream.declaredBytes) : Json(nullptr)},
                  {"entries", stream.entries},
                  {"cut_short", stream.isCutShort}};
    addText(document, "file", output);
    return document;
}

void print(const SalvagedStream& stream, const std::string& output) {
    writeOutput(fmt::format("{}: {} {}, {} bytes from offset {}, {}{}\n", shown(output), stream.entries,
                            stream.entries == 1 ? "entry" : "entries", stream.bytes, stream.offset,
                            originText(stream.origin), stream.isCutShort ? ", cut short" : ""));
}

bool isWhole(const SalvagedStream& stream) {
    return stream.origin == SalvagedStream::Reachable && !stream.isCutShort;
}

ExitCode salvage(const SalvageOptions& options, RunReport& report) {
    const InputFile input(options.file);
    const SalvageReport found = search(input.path());
    if (found.streams.empty()) {
        complain(fmt::format("{}: no metadata streams anywhere in it", input.name()));
        return ExitNoMetaData;
    }
    createFolder(options.folder);
    const std::vector<std::string> outputs = outputsFor(found.streams, options.folder);
    requireFree(outputs, options.force);
    if (report.isWanted()) {
        report.beginFile(input.name()).member("complete", !found.hasMore);
        report.writer().beginArray("streams");
    }
    ExitCode worst = found.hasMore ? ExitDamaged : ExitFine;
    for (std::size_t i = 0; i < outputs.size(); ++i) {
        const SalvagedStream& stream = found.streams[i];
        writePart(input, stream.offset, stream.bytes, outputs[i], options.force);
        worst = worseOf(worst, isWhole(stream) ? ExitFine : ExitDamaged);
        if (report.isWanted())
            report.writer().element(streamDocument(stream, outputs[i]));
        else if (!settings().quiet)
            print(stream, outputs[i]);
    }
    if (found.hasMore)
        complain(fmt::format("{}: has more than {} places that look like streams; the rest was not looked into",
                             input.name(), SalvageReport::s_maximumStreams));
    return worst;
}

} // namespace

void addSalvageCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<SalvageOptions>();
    CLI::App* command = app.add_subcommand(
        "salvage", "Search a damaged file for metadata streams, and write what is whole. Ends with 3 if something "
                   "was out of reach or is cut short");
    command->add_option("FILE", options->file, "Any file; - is standard input")->required();
    command
        ->add_option(
            "-o,--output", options->folder,
            "The folder for the stream files. The best stream of a kind becomes KIND.dat, the next one KIND-2.dat and "
            "so on")
        ->type_name("DIR")
        ->required();
    command->add_flag("--force", options->force, "Replace files that exist already");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm salvage Broken.mp4 -o rescued\n"
                    "zulm salvage Broken.mp4 -o rescued && zulm attach Copy.mp4 rescued/*.dat -o Whole.mp4");
    command->callback([options, &chosen] {
        chosen = reporting("salvage", options->json, {options->file},
                           [options](RunReport& report) { return salvage(*options, report); });
    });
}

} // namespace Zulm
