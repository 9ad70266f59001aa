#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Layout.h"
#include "Tools/zulm/Recording.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"

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
    Json document{{"type", printable(entry.item.type)},
                  {"offset", entry.item.offset},
                  {"size", entry.size},
                  {"header", entry.headerForm()},
                  {"header_size", entry.item.headerSize}};
    if (entry.stream)
        document["stream"] = {{"kind", kindDocument(*entry.stream)}, {"uuid", uuidText(*entry.stream)}};
    if (entry.isForeign)
        document["foreign"] = true;
    if (entry.isMetaData) {
        document["children"] = Json::array();
        for (const LayoutItem& child : entry.children)
            document["children"].push_back(itemDocument(child));
    }
    return document;
}

Json fileDocument(const Recording& recording, const Layout& layout) {
    Json document = fileHeader(recording.name());
    document.update(Json{{"container", recording.container()},
                         {"bytes", layout.fileSize},
                         {"items", Json::array()},
                         {"ends", Json::array()}});
    for (const LayoutItem& item : layout.items)
        document["items"].push_back(itemDocument(item));
    for (const LayoutEnd& end : layout.ends)
        document["ends"].push_back({{"offset", end.offset}, {"reason", end.reason}});
    return document;
}

std::string remarkOn(const LayoutItem& entry) {
    if (entry.stream)
        return metaDataKindName(*entry.stream);
    return entry.isForeign ? "foreign" : "";
}

void printItem(const LayoutItem& entry, int depth) {
    const std::string type = std::string(static_cast<std::size_t>(2 * depth), ' ') + printable(entry.item.type);
    std::string line = fmt::format("  {:<12}  {:>16}  {:>16}  {:<10}  {}", type, entry.item.offset, entry.size,
                                   entry.headerForm(), remarkOn(entry));
    line.erase(line.find_last_not_of(' ') + 1);
    writeOutput(line + '\n');
    for (const LayoutItem& child : entry.children)
        printItem(child, depth + 1);
}

void print(const Recording& recording, const Layout& layout) {
    writeOutput(fmt::format("{}: {}, {} bytes\n", shown(recording.name()), recording.container(), layout.fileSize));
    writeOutput(
        heading(fmt::format("  {:<12}  {:>16}  {:>16}  {:<10}  {}", "type", "offset", "size", "header", "stream")) +
        '\n');
    for (const LayoutItem& item : layout.items)
        printItem(item, 0);
    for (const LayoutEnd& end : layout.ends)
        writeOutput(fmt::format("  ends at {}: {}\n", end.offset, end.reason));
}

ExitCode showAtoms(const std::string& path, const AtomsOptions& options, Json& files) {
    const InputFile input(path);
    Recording recording(input.path(), input.name());
    if (recording.parser().getStreamType() == MetaDataParser::RawStream)
        throw Failure(
            fmt::format("{}: a bare stream has no atoms; 'zulm info {}' shows what it is", path, shellWord(path)));
    const Layout layout = layoutOf(recording);
    for (const LayoutEnd& end : layout.ends)
        warnAbout(path, fmt::format("the walk ends at offset {}: {}", end.offset, end.reason));
    if (options.json)
        files.push_back(fileDocument(recording, layout));
    else
        print(recording, layout);
    return layout.ends.empty() ? ExitFine : ExitDamaged;
}

ExitCode runAtoms(const AtomsOptions& options) {
    Json files = Json::array();
    const ExitCode code =
        forEachFile(options.files, [&](const std::string& path) { return showAtoms(path, options, files); });
    if (options.json)
        printReport("atoms", std::move(files));
    return code;
}

} // namespace

void addAtomsCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<AtomsOptions>();
    CLI::App* command = app.add_subcommand("atoms", "Show the atoms of a movie or the chunks of a RIFF file");
    command->add_option("FILE", options->files, "Movies or RIFF files; - is standard input")->required();
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm atoms Recording.mp4");
    command->callback([options, &chosen] { chosen = [options] { return runAtoms(*options); }; });
}

} // namespace Zulm
