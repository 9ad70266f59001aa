#include "Tools/zulm/InfoReport.h"

#include "Tools/zulm/Findings.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/Text.h"

#include <fmt/core.h>

#include <cmath>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

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

} // namespace

Json creatorDocument(const CreatorAttributes& creator) {
    const auto [name, version, platformVersion] = creator.storedTexts();
    Json document;
    addText(document, "name", name);
    addText(document, "version", version);
    addText(document, "platform_version", platformVersion);
    return document;
}

std::string shownCreator(const CreatorAttributes& creator) {
    const auto [name, version, platformVersion] = creator.storedTexts();
    return fmt::format("{} {} on version {}", shown(name), shown(version), shown(platformVersion));
}

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

FileInfo inspect(Recording& recording) {
    const ValidationReport& validation = recording.validation();
    const auto read = [&](auto value) {
        requireRead(recording.parser().getStream(), recording.name());
        return value;
    };
    return {recording.name(),
            recording.container(),
            read(movieDuration(recording.parser())),
            recording.streams(),
            read(readRecordingInfo(recording.parser())),
            read(layoutOf(recording, LayoutPart::MetaData)),
            validation.allFindings(),
            validation.isDamaged()};
}

Json infoDocument(const FileInfo& file) {
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
    for (const ZCAPHeader& info : file.creators)
        document["creators"].push_back(creatorDocument(info.creator));
    for (const LayoutItem& child : metaDataChildren(file.layout))
        if (child.isForeign)
            document["foreign_atoms"].push_back(
                {{"type", printable(child.item.type)}, {"offset", child.item.offset}, {"size", child.size}});
    for (const Finding& finding : file.warnings)
        document["warnings"].push_back(findingDocument(finding));
    return document;
}

} // namespace Zulm
