#include "Tools/zulm/EntryFormat.h"

#include <fmt/core.h>

#include <cmath>
#include <variant>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

Json document(std::int32_t value) {
    return value;
}
Json document(std::int64_t value) {
    return std::to_string(value);
} // more than a JSON number holds everywhere
Json document(float value) {
    return std::isfinite(value) ? Json::parse(fmt::format("{}", value)) : Json(value);
}
Json document(const std::string& value) {
    return validText(value);
}
Json document(const std::shared_ptr<const Image>& image) {
    return {{"width", image->width()}, {"height", image->height()}};
}

std::string dumped(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}

/// A value on its own: texts without quotes, an image as 32x32 (1234 bytes).
std::string plain(const Json& value) {
    if (value.is_object())
        return fmt::format("{}x{} ({} bytes)", value["width"].get<std::uint32_t>(),
                           value["height"].get<std::uint32_t>(), value["bytes"].get<std::uint32_t>());
    return value.is_string() ? value.get<std::string>() : dumped(value);
}

std::string csvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos)
        return text;
    std::string doubled;
    for (const char c : text)
        doubled.append(c == '"' ? 2 : 1, c);
    return fmt::format("\"{}\"", doubled);
}

template <class TextOf>
std::string csvLine(const Json& entry, TextOf textOf) {
    std::string line;
    for (const auto& item : entry.items()) {
        if (!line.empty())
            line += ',';
        line += csvField(textOf(item));
    }
    return line;
}

std::string textLine(const Json& entry) {
    std::string line = fmt::format("{:>12.6f}", entry["timestamp"].get<double>());
    for (const auto& item : entry.items())
        if (item.key() != "timestamp")
            line += fmt::format("  {}={}", item.key(),
                                item.value().is_object() ? plain(item.value()) : dumped(item.value()));
    return line;
}

} // namespace

std::string validText(const std::string& bytes) {
    return isUTF8(bytes) ? bytes : Json::parse(dumped(bytes)).get<std::string>();
}

Json entryDocument(const EntryDictionary& entry, double time, std::uint32_t imageSize) {
    Json result = Json::object();
    for (const auto& [key, value] : entry)
        result[key] = std::visit([](const auto& held) { return document(held); }, value);
    result["timestamp"] = time;
    if (result.contains("image") && result["image"].is_object())
        result["image"]["bytes"] = imageSize;
    return result;
}

std::string formatted(const Json& entry, EntryFormat format) {
    switch (format) {
    case EntryFormat::NDJSON: return dumped(entry);
    case EntryFormat::CSV: return csvLine(entry, [](const auto& item) { return plain(item.value()); });
    default: return textLine(entry);
    }
}

std::string csvHeader(const Json& entry) {
    return csvLine(entry, [](const auto& item) { return item.key(); });
}

} // namespace Zulm
