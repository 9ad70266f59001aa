#include "Reports/Layout.h"
#include "Reports/Text.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct AtomsOptions {
    std::vector<std::string> files;
    bool json = false;
};

Json itemDocument(const LayoutItem& entry) {
    Json document{{"type", printable(entry.item.type.text())},
                  {"offset", entry.item.offset},
                  {"size", entry.size},
                  {"header", entry.headerForm()},
                  {"header_size", entry.item.headerSize}};
    if (entry.stream)
        document["stream"] = {{"kind", kindDocument(*entry.stream)}, {"uuid", uuidText(*entry.stream)}};
    if (entry.isForeign)
        document["foreign"] = true;
    return document;
}

/// A file may hold millions of atoms, so they are written as they are met; where they end is found by a second walk.
void writeReport(RecordingFile& recording, const LayoutVisitor& ends, RunReport& report) {
    JsonWriter& writer = report.beginFile(recording.name());
    writer.member("container", containerName(recording.container()));
    writer.member("bytes", recording.size());
    writer.beginArray("items");
    const auto begin = [&](const LayoutItem& item, bool) {
        if (!item.isMetaData)
            return writer.element(itemDocument(item));
        writer.beginObject();
        writer.members(itemDocument(item));
        writer.beginArray("children");
    };
    const std::size_t depth = writer.depth();
    walkLayout(recording, LayoutPart::Whole, {begin, [&] { writer.endTo(depth); }});
    writer.end();
    writer.beginArray("ends");
    walkLayout(recording, LayoutPart::MetaData, ends);
    writer.end();
    writer.end();
}

std::string remarkOn(const LayoutItem& entry) {
    if (entry.stream)
        return metaDataKindName(*entry.stream);
    return entry.isForeign ? "foreign" : "";
}

void printItem(const LayoutItem& entry, bool isChild) {
    const std::string type = (isChild ? "  " : "") + printable(entry.item.type.text());
    std::string line = fmt::format("  {:<12}  {:>16}  {:>16}  {:<10}  {}", type, entry.item.offset, entry.size,
                                   entry.headerForm(), remarkOn(entry));
    line.erase(line.find_last_not_of(' ') + 1);
    writeOutput(line + '\n');
}

void print(RecordingFile& recording, const LayoutVisitor& ends) {
    writeOutput(fmt::format("{}: {}, {} bytes\n", shown(recording.name()), containerName(recording.container()),
                            recording.size()));
    writeOutput(
        heading(fmt::format("  {:<12}  {:>16}  {:>16}  {:<10}  {}", "type", "offset", "size", "header", "stream")) +
        '\n');
    walkLayout(recording, LayoutPart::Whole, {printItem});
    walkLayout(recording, LayoutPart::MetaData, ends);
}

ExitCode showAtoms(const std::string& path, RunReport& report) {
    const InputFile input(path);
    RecordingFile recording = input.open();
    if (recording.container() == Container::RawStream)
        throw Failure(
            fmt::format("{}: a bare stream has no atoms; 'zulm info {}' shows what it is", path, shellWord(path)));
    ExitCode code = ExitFine;
    LayoutVisitor ends;
    ends.end = [&](const LayoutEnd& end) {
        code = ExitDamaged;
        warn(fmt::format("{}: the walk ends at offset {}: {}", path, end.offset, end.reason));
        if (report.isWanted())
            report.writer().element({{"offset", end.offset}, {"reason", end.reason}});
        else
            writeOutput(fmt::format("  ends at {}: {}\n", end.offset, end.reason));
    };
    if (report.isWanted())
        writeReport(recording, ends, report);
    else
        print(recording, ends);
    return code;
}

} // namespace

void addAtomsCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<AtomsOptions>();
    CLI::App* command = app.add_subcommand("atoms", "Show the atoms of a movie or the chunks of a RIFF file");
    command->add_option("FILE", options->files, "Movies or RIFF files; - is standard input")->required();
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm atoms Recording.mp4");
    command->callback(
        [options, &chosen] { chosen = reportingOnEach("atoms", options->json, options->files, showAtoms); });
}

} // namespace Zulm
