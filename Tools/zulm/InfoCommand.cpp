#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"
#include "Tools/zulm/Report.h"

#include <fmt/core.h>
#include <nlohmann/json.hpp>

#include <algorithm>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct InfoOptions {
    std::vector<std::string> files;
    bool json = false;
};

struct FileInfo {
    std::string path;
    std::string container;
    std::vector<StreamInfo> streams;
    std::vector<ZCAPHeader> creators;
};

FileInfo inspect(const std::string& path) {
    Recording recording(path);
    return {path, recording.container(), recording.streams(), readRecordingInfo(recording.parser())};
}

bool isDamaged(const StreamInfo& stream) {
    return !stream.damage.empty();
}

ExitCode exitCodeFor(const FileInfo& file) {
    if (file.streams.empty())
        return ExitNoMetaData;
    return std::ranges::any_of(file.streams, isDamaged) ? ExitDamaged : ExitFine;
}

Json timeDocument(const std::optional<double>& time) {
    return time ? Json(*time) : Json(nullptr);
}

Json streamDocument(const StreamInfo& stream) {
    Json document{{"kind", stream.kind.empty() ? Json(nullptr) : Json(stream.kind)},
                  {"uuid", uuidText(stream.type)},
                  {"version", stream.version},
                  {"entries", stream.isDecodable ? Json(stream.entries) : Json(nullptr)},
                  {"first_time", timeDocument(stream.firstTime)},
                  {"last_time", timeDocument(stream.lastTime)},
                  {"offset", stream.range.offset},
                  {"bytes", stream.range.length}};
    if (isDamaged(stream))
        document["damage"] = stream.damage;
    return document;
}

Json creatorDocument(const ZCAPHeader& info) {
    return {{"name", info.creator.name()},
            {"version", info.creator.version()},
            {"platform_version", info.creator.platformVersion()}};
}

Json fileDocument(const FileInfo& file) {
    Json document{
        {"path", file.path}, {"container", file.container}, {"streams", Json::array()}, {"creators", Json::array()}};
    for (const StreamInfo& stream : file.streams)
        document["streams"].push_back(streamDocument(stream));
    for (const ZCAPHeader& creator : file.creators)
        document["creators"].push_back(creatorDocument(creator));
    return document;
}

std::string timeText(const std::optional<double>& time) {
    return time ? fmt::format("{:.3f}", *time) : "-";
}

void print(const FileInfo& file) {
    constexpr auto row = "  {:<23}  {:>9}  {:>10}  {:>10}  {:>10}  {:>7}  {}\n";
    fmt::print("{}: {}, {} stream{}\n", file.path, file.container, file.streams.size(),
               file.streams.size() == 1 ? "" : "s");
    if (!file.streams.empty())
        fmt::print(row, "kind", "entries", "first s", "last s", "bytes", "version", "uuid");
    for (const StreamInfo& stream : file.streams)
        fmt::print(row, stream.kind.empty() ? "(unknown)" : stream.kind,
                   stream.isDecodable ? std::to_string(stream.entries) : "-", timeText(stream.firstTime),
                   timeText(stream.lastTime), stream.range.length, stream.version, uuidText(stream.type));
    for (const ZCAPHeader& creator : file.creators)
        fmt::print("  creator: {} {} on version {}\n", creator.creator.name(), creator.creator.version(),
                   creator.creator.platformVersion());
}

void warn(const FileInfo& file) {
    for (const StreamInfo& stream : file.streams)
        if (isDamaged(stream))
            complain(fmt::format("{}: {} at offset {}: {}", file.path, nameOf(stream.type), stream.range.offset,
                                 stream.damage));
}

ExitCode runInfo(const InfoOptions& options) {
    ExitCode worst = ExitFine;
    Json files = Json::array();
    for (const std::string& path : options.files) {
        try {
            const FileInfo file = inspect(path);
            warn(file);
            worst = worseOf(worst, exitCodeFor(file));
            if (options.json)
                files.push_back(fileDocument(file));
            else
                print(file);
        } catch (const Failure& failure) {
            complain(failure.what());
            worst = worseOf(worst, ExitFailed);
        }
    }
    if (options.json)
        printReport("info", std::move(files));
    return worst;
}

} // namespace

void addInfoCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<InfoOptions>();
    CLI::App* command = app.add_subcommand("info", "Show which metadata streams a file holds");
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files")->required();
    command->add_flag("--json", options->json, "Print one JSON document");
    command->callback([options, &chosen] { chosen = [options] { return runInfo(*options); }; });
}

} // namespace Zulm
