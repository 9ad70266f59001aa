#include "Tools/zulm/ViewerPage.h"

#include "Reports/Findings.h"
#include "Reports/InfoReport.h"
#include "Reports/Text.h"
#include "Tools/zulm/PackedBytes.h"
#include "Tools/zulm/Substitutes.h"
#include "ZULMetaDataBridge/Source/MetaDataExcerpt.h"

#include <fmt/core.h>

#include <filesystem>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

bool isPlainInAddress(char c) {
    const auto isBetween = [c](char first, char last) { return c >= first && c <= last; };
    return isBetween('a', 'z') || isBetween('A', 'Z') || isBetween('0', '9') ||
           std::string_view("-._~/").find(c) != std::string_view::npos;
}

} // namespace

ViewedRecording viewedRecording(RecordingFile& recording, const Json& movie) {
    const std::string excerpt = orFileError(recording.name(), [&] { return metaDataExcerpt(recording.parser()); });
    const std::string name = std::filesystem::path(recording.name()).filename().string();
    Json info = infoDocument(recording);
    info["path"] = validText(name); // the page may go to people who need not know the folder
    Json document{{"schema", "zulm.view"},           {"schema_version", 2},
                  {"tool_version", ZULM_VERSION},    {"name", validText(name)},
                  {"info", std::move(info)},         {"verify", verifyDocument(name, recording.validation())},
                  {"metadata_size", excerpt.size()}, {"movie", movie}};
    return {std::move(document), base64(packed(excerpt))};
}

std::string relativeAddress(const std::string& file, const std::string& folder) {
    namespace fs = std::filesystem;
    const fs::path base = fs::canonical(folder.empty() ? "." : folder);
    std::string address;
    for (const char c : fs::canonical(file).lexically_relative(base).generic_string())
        address += isPlainInAddress(c) ? std::string(1, c) : fmt::format("%{:02X}", static_cast<unsigned char>(c));
    return address;
}

std::string embeddedAddress(const RecordingFile& recording) {
    const bool isWave = recording.container() == Container::Riff;
    return fmt::format("data:{};base64,", isWave ? "audio/wav" : "video/mp4");
}

std::string scriptText(const Json& document) {
    return substituted(jsonLine(document), {{'<', "\\u003c"}});
}

} // namespace Zulm
