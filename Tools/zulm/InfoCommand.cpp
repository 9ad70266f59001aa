#include "Tools/zulm/Command.h"
#include "Tools/zulm/Findings.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Layout.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/Recording.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <iterator>
#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct InfoOptions {
    std::vector<std::string> files;
    bool json = false;
};

struct FileInfo {
    std::string name;
    std::string container;
    std::optional<double> duration;
    std::vector<StreamInfo> streams;
    std::vector<ZCAPHeader> creators;
    Layout layout;
    std::vector<Finding> warnings;
    bool isDamaged = false;
};

bool isDamage(const Finding& finding) {
    return finding.severity() == Severity::Damage;
}

/// Between the first and the last entry; none where they are at one time or at none.
std::optional<double> entriesPerSecond(const StreamInfo& stream) {
    if (!stream.firstTime || !stream.lastTime || stream.entries < 2)
        return std::nullopt;
    const double rate = static_cast<double>(stream.entries - 1) / (*stream.lastTime - *stream.firstTime);
    return std::isfinite(rate) && rate > 0 ? std::optional(rate) : std::nullopt;
}

std::vector<LayoutItem> metaDataChildren(const Layout& layout) {
    std::vector<LayoutItem> children;
    for (const LayoutItem& item : layout.items)
        children.insert(children.end(), item.children.begin(), item.children.end());
    return children;
}

FileInfo inspect(const std::string& path) {
    const InputFile input(path);
    Recording recording(input.path(), input.name());
    const ValidationReport& validation = recording.validation();
    const auto read = [&](auto value) {
        requireRead(recording.parser().getStream(), input.name());
        return value;
    };
    return {input.name(),
            recording.container(),
            read(movieDuration(recording.parser())),
            recording.streams(),
            read(readRecordingInfo(recording.parser())),
            read(layoutOf(recording)),
            validation.allFindings(),
            validation.isDamaged()};
}

ExitCode exitCodeFor(const FileInfo& file) {
    if (file.isDamaged)
        return ExitDamaged;
    return file.streams.empty() ? ExitNoMetaData : ExitFine;
}

Json streamDocument(const StreamInfo& stream) {
    Json document{{"kind", kindDocument(stream.type)},
                  {"uuid", uuidText(stream.type)},
                  {"version", stream.version},
                  {"entries", stream.isDecodable ? Json(stream.entries) : Json(nullptr)},
                  {"first_time", numberDocument(stream.firstTime)},
                  {"last_time", numberDocument(stream.lastTime)},
                  {"entries_per_second", numberDocument(entriesPerSecond(stream))},
                  {"offset", stream.range.offset},
                  {"bytes", stream.range.length}};
    if (!stream.damage.empty())
        document["damage"] = stream.damage;
    return document;
}

Json creatorDocument(const ZCAPHeader& info) {
    return {{"name", info.creator.name()},
            {"version", info.creator.version()},
            {"platform_version", info.creator.platformVersion()}};
}

Json fileDocument(const FileInfo& file) {
    Json document = fileHeader(file.name);
    document.update(Json{{"container", file.container},
                         {"bytes", file.layout.fileSize},
                         {"duration", numberDocument(file.duration)},
                         {"streams", Json::array()},
                         {"creators", Json::array()},
                         {"foreign_atoms", Json::array()},
                         {"warnings", Json::array()}});
    for (const StreamInfo& stream : file.streams)
        document["streams"].push_back(streamDocument(stream));
    for (const ZCAPHeader& creator : file.creators)
        document["creators"].push_back(creatorDocument(creator));
    for (const LayoutItem& child : metaDataChildren(file.layout))
        if (child.isForeign)
            document["foreign_atoms"].push_back(
                {{"type", printable(child.item.type)}, {"offset", child.item.offset}, {"size", child.size}});
    for (const Finding& finding : file.warnings)
        document["warnings"].push_back(findingDocument(finding));
    return document;
}

std::string numberText(const std::optional<double>& number, int digits) {
    return number ? fmt::format("{:.{}f}", *number, digits) : "-";
}

void printRow(const StreamInfo& stream) {
    writeOutput(fmt::format("  {:<23}  {:>9}  {:>10}  {:>10}  {:>8}  {:>10}  {:>7}  {}\n",
                            stream.kind.empty() ? "(unknown)" : stream.kind,
                            stream.isDecodable ? std::to_string(stream.entries) : "-", numberText(stream.firstTime, 3),
                            numberText(stream.lastTime, 3), numberText(entriesPerSecond(stream), 2),
                            stream.range.length, stream.version, uuidText(stream.type)));
}

void print(const FileInfo& file) {
    const std::string duration = file.duration ? fmt::format("{:.3f} s", *file.duration) : "duration not told";
    writeOutput(fmt::format("{}: {}, {}, {}, {} stream{}\n", withoutControls(file.name), file.container, duration,
                            bytesText(file.layout.fileSize), file.streams.size(), file.streams.size() == 1 ? "" : "s"));
    if (!file.streams.empty())
        writeOutput(heading(fmt::format("  {:<23}  {:>9}  {:>10}  {:>10}  {:>8}  {:>10}  {:>7}  {}", "kind", "entries",
                                        "first s", "last s", "per s", "bytes", "version", "uuid")) +
                    '\n');
    for (const StreamInfo& stream : file.streams)
        printRow(stream);
    for (const ZCAPHeader& creator : file.creators)
        writeOutput(fmt::format("  creator: {} {} on version {}\n", shown(creator.creator.name()),
                                shown(creator.creator.version()), shown(creator.creator.platformVersion())));
    for (const LayoutItem& child : metaDataChildren(file.layout))
        if (child.isForeign)
            writeOutput(fmt::format("  foreign atom: '{}' at offset {}, {} bytes\n", printable(child.item.type),
                                    child.item.offset, child.size));
}

/// Only so many: the rest is for the command that is made for it.
void warnOf(const FileInfo& file) {
    constexpr std::size_t most = 5;
    std::vector<Finding> damage;
    std::copy_if(file.warnings.begin(), file.warnings.end(), std::back_inserter(damage), isDamage);
    for (std::size_t i = 0; i < std::min(most, damage.size()); ++i)
        warn(fmt::format("{}: {}", file.name, findingText(damage[i])));
    if (file.isDamaged)
        warn(fmt::format("{}: 'zulm verify {}' says {}", file.name, shellWord(file.name),
                         damage.size() > most ? fmt::format("{} more", damage.size() - most) : "what that means"));
}

ExitCode runInfo(const InfoOptions& options) {
    Json files = Json::array();
    const ExitCode code = forEachFile(options.files, [&](const std::string& path) {
        const FileInfo file = inspect(path);
        warnOf(file);
        if (options.json)
            files.push_back(fileDocument(file));
        else
            print(file);
        return exitCodeFor(file);
    });
    if (options.json)
        printReport("info", std::move(files));
    return code;
}

} // namespace

void addInfoCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<InfoOptions>();
    CLI::App* command = app.add_subcommand("info", "Show which metadata streams a file holds");
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files; - is standard input")->required();
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm info Recording.mp4\nzulm info --json *.mp4");
    command->callback([options, &chosen] { chosen = [options] { return runInfo(*options); }; });
}

} // namespace Zulm
