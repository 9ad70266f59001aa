#include "Tools/zulm/EntryFormat.h"

#include "Tools/zulm/Number.h"
#include "Tools/zulm/Report.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <cmath>
#include <string_view>
#include <variant>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_time = "timestamp";
constexpr auto s_shortTime = "timestamp_f32";
constexpr auto s_damage = "damage";
constexpr auto s_image = "image";
constexpr std::string_view s_storedSuffix = "_base64";

Json document(std::int32_t value) {
    return value;
}
Json document(std::int64_t value) { // more than a JSON number holds everywhere
    return std::to_string(value);
}
Json document(float value) {
    return std::isfinite(value) ? Json(shortestNumber(value)) : numberDocument(value);
}
Json document(const std::string& value) {
    return validText(value);
}
Json document(const std::shared_ptr<const Image>& image) {
    return {{"width", image->width()}, {"height", image->height()}};
}

void addStored(Json& entry, const std::string& key, const std::string& stored) {
    if (entry[key].get_ref<const std::string&>() != stored)
        entry[key + std::string(s_storedSuffix)] = base64(stored);
}

/// A value on its own: texts without quotes, an image as 32x32 (1234 bytes).
std::string plain(const Json& value) {
    if (value.is_object() && value.contains(s_damage))
        return fmt::format("({} bytes, {})", value["bytes"].get<std::uint32_t>(),
                           value[s_damage].get_ref<const std::string&>());
    if (value.is_object())
        return fmt::format("{}x{} ({} bytes)", value["width"].get<std::uint32_t>(),
                           value["height"].get<std::uint32_t>(), value["bytes"].get<std::uint32_t>());
    if (value.is_null())
        return "nil";
    return value.is_string() ? value.get<std::string>() : jsonLine(value);
}

std::string csvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos)
        return text;
    std::string doubled;
    for (const char c : text)
        doubled.append(c == '"' ? 2 : 1, c);
    return fmt::format("\"{}\"", doubled);
}

bool isShownInText(std::string_view key) {
    return key != s_time && key != s_shortTime && !key.ends_with(s_storedSuffix);
}

} // namespace

Json entryDocument(const EntryDictionary& entry, double time) {
    Json result = Json::object();
    for (const auto& [key, value] : entry)
        result[key] = std::visit([](const auto& held) { return document(held); }, value);
    for (const auto& [key, value] : entry)
        if (const auto* text = std::get_if<std::string>(&value))
            addStored(result, key, *text);
    result[s_time] = numberDocument(time);
    const auto shortTime = static_cast<float>(time);
    if (static_cast<double>(shortTime) != time && !std::isnan(time))
        result[s_shortTime] = numberDocument(shortTime); // with the digits that tell it from the exact one
    return result;
}

Json textEntryDocument(const EntryDictionary& entry, double time, const std::string& stored) {
    Json result = entryDocument(entry, time);
    addStored(result, entry.begin()->first, stored);
    return result;
}

Json cursorEntryDocument(const EntryDictionary& entry, double time, const CursorImage& stored) {
    Json result = entryDocument(entry, time);
    Json& image = result[s_image];
    if (!image.is_object())
        image = stored.imageDataSize == 0 ? Json(nullptr) : Json{{s_damage, "cannot be decoded"}};
    if (image.is_object())
        image["bytes"] = stored.imageDataSize;
    return result;
}

Json listEntryDocument(const EntryDictionary& entry, double time, const std::list<std::string>& stored) {
    Json result = entryDocument(entry, time);
    auto key = entry.begin();
    auto text = stored.begin();
    for (; text != stored.end() && key->first != s_time; ++text, ++key)
        addStored(result, key->first, *text);
    if (key->first != s_time)
        result[s_damage] = fmt::format("{} texts, fewer than its kind has", stored.size());
    for (; key->first != s_time; ++key)
        result[key->first] = nullptr;
    for (; text != stored.end(); ++text)
        result["further"].push_back(validText(*text));
    return result;
}

std::string damageOf(const Json& entry) {
    if (entry.contains(s_damage))
        return entry[s_damage].get<std::string>();
    const auto image = entry.find(s_image);
    return image != entry.end() && image->is_object() && image->contains(s_damage)
               ? fmt::format("its image {}", (*image)[s_damage].get_ref<const std::string&>())
               : std::string();
}

std::string jsonLine(const Json& document) {
    return document.dump(-1, ' ', false, Json::error_handler_t::replace);
}

std::string textLine(const Json& entry) {
    const Json& time = entry[s_time];
    std::string line =
        time.is_number() ? fmt::format("{:>12.6f}", time.get<double>()) : fmt::format("{:>12}", plain(time));
    for (const auto& [key, value] : entry.items())
        if (isShownInText(key))
            line += fmt::format("  {}={}", key,
                                value.is_string() ? jsonLine(shown(value.get<std::string>())) : plain(value));
    return line;
}

std::string csvLine(const Json& entry, const EntryKeys& keys) {
    std::string line;
    for (const std::string& key : keys) {
        const Json& value = entry.at(key);
        if (&key != &keys.front())
            line += ',';
        if (!value.is_null())
            line += csvField(plain(value));
    }
    return line;
}

std::string csvHeader(const EntryKeys& keys) {
    return fmt::format("{}", fmt::join(keys, ","));
}

} // namespace Zulm
