#include "Reports/InfoReport.h"

#include "Reports/Findings.h"
#include "Reports/Report.h"
#include "Reports/Text.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <cmath>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

Json streamDocument(const StreamReport& stream) {
    Json document{{"kind", kindDocument(stream.type)},
                  {"uuid", uuidText(stream.type)},
                  {"version", stream.version},
                  {"entries", isDecodable(stream.header()) ? Json(stream.wholeEntries) : Json(nullptr)},
                  {"first_time", numberDocument(stream.firstTime)},
                  {"last_time", numberDocument(stream.lastTime)},
                  {"entries_per_second", numberDocument(entriesPerSecond(stream))},
                  {"offset", stream.offset},
                  {"bytes", stream.declaredBytes}};
    if (const std::string damage = damageIn(stream); !damage.empty())
        document["damage"] = damage;
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

std::optional<double> entriesPerSecond(const StreamReport& stream) {
    if (!stream.firstTime || !stream.lastTime || stream.wholeEntries < 2)
        return std::nullopt;
    const double rate = static_cast<double>(stream.wholeEntries - 1) / (*stream.lastTime - *stream.firstTime);
    return std::isfinite(rate) && rate > 0 ? std::optional(rate) : std::nullopt;
}

void visitForeignAtoms(RecordingFile& recording, const std::function<void(const LayoutItem& atom)>& visit) {
    walkLayout(recording, LayoutPart::MetaData, {[&](const LayoutItem& item, bool) {
                   if (item.isForeign)
                       visit(item);
               }});
}

FileInfo inspect(RecordingFile& recording) {
    FileInfo file;
    file.streams = recording.examinedStreams(); // finds the duration on its way
    file.duration = recording.duration();
    file.creators = recording.creators();
    return file;
}

void writeInfo(JsonWriter& writer, RecordingFile& recording, const FileInfo& file) {
    writer.beginObject();
    writer.members(fileHeader(recording.name()));
    writer.members({{"container", containerName(recording.container())},
                    {"bytes", recording.size()},
                    {"duration", numberDocument(file.duration)}});
    writer.array("streams", file.streams, streamDocument);
    writer.array("creators", file.creators, [](const ZCAPHeader& info) { return creatorDocument(info.creator); });
    writer.beginArray("foreign_atoms");
    visitForeignAtoms(recording, [&](const LayoutItem& atom) {
        writer.element({{"type", printable(atom.item.type.text())}, {"offset", atom.item.offset}, {"size", atom.size}});
    });
    writer.end();
    writer.array("warnings", recording.validation().allFindings(), findingDocument);
    writer.end();
}

Json infoDocument(RecordingFile& recording) {
    std::string text;
    JsonWriter writer([&text](std::string_view piece) { text += piece; }, JsonWriter::Style::Lines);
    writeInfo(writer, recording, inspect(recording));
    return Json::parse(text);
}

} // namespace Zulm
