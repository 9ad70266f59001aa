#include "Reports/EntryFormat.h"

#include "Platform/Image.h"
#include "Reports/Number.h"
#include "Reports/Text.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <cmath>
#include <string_view>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_time = "timestamp";
constexpr auto s_shortTime = "timestamp_f32";
constexpr auto s_damage = "damage";
constexpr auto s_image = "image";
constexpr auto s_further = "further";
constexpr std::string_view s_storedSuffix = "_base64";

/// The bytes of a text of the entry: what is stored if its text had to be mended, else the text.
std::string bytesOf(const Json& entry, const std::string& key) {
    const auto& text = entry[key].get_ref<const std::string&>();
    const auto stored = entry.find(key + std::string(s_storedSuffix));
    if (stored == entry.end())
        return text;
    std::string bytes = bytesOfBase64(stored->get_ref<const std::string&>());
    return validText(bytes) == text ? bytes : text; // texts of ISO 8859-1 are whole already
}

/// The picture is checked and measured, but not decoded: a small file can claim a gigabyte of pixels.
Json imageDocument(const CursorImage& stored) {
    if (stored.imageDataSize == 0)
        return nullptr;
    EncodedImageCheck check;
    if (stored.imageData)
        check = Image::checkEncodedBytes({stored.imageData, stored.imageDataSize});
    Json image{{s_damage, "cannot be decoded"}};
    if (check.state != EncodedImageCheck::Undecodable)
        image = {{"width", check.width}, {"height", check.height}};
    image["bytes"] = stored.imageDataSize;
    return image;
}

/// A value that is no text: an image as 32x32 (1234 bytes).
std::string plain(const Json& value) {
    if (value.is_object() && value.contains(s_damage))
        return fmt::format("({} bytes, {})", value["bytes"].get<std::uint32_t>(),
                           value[s_damage].get_ref<const std::string&>());
    if (value.is_object())
        return fmt::format("{}x{} ({} bytes)", value["width"].get<std::uint32_t>(),
                           value["height"].get<std::uint32_t>(), value["bytes"].get<std::uint32_t>());
    if (value.is_null())
        return "nil";
    return value.is_string() ? shown(value.get_ref<const std::string&>()) : jsonLine(value);
}

std::string quoted(const std::string& bytes) {
    std::string text(1, '"');
    for (const char c : shown(bytes))
        text.append(c == '"' ? "\\" : "").append(1, c);
    return text += '"';
}

std::string csvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos)
        return text;
    std::string doubled;
    for (const char c : text)
        doubled.append(c == '"' ? 2 : 1, c);
    return fmt::format("\"{}\"", doubled);
}

std::string timeText(const Json& time) {
    return time.is_number() ? fmt::format("{:>12.6f}", time.get<double>()) : fmt::format("{:>12}", plain(time));
}

bool isShownInText(std::string_view key) {
    return key != s_time && key != s_shortTime && !key.ends_with(s_storedSuffix);
}

} // namespace

void EntryDocument::add(const char* key, float value) {
    add(key, std::isfinite(value) ? shortestNumber(value) : static_cast<double>(value));
}

void EntryDocument::add(const char* key, const CursorImage& cursor) {
    document_[key] = imageDocument(cursor);
}

void EntryDocument::addText(const char* key, const std::string& text, const std::string& stored) {
    const std::string valid = validText(text);
    document_[key] = valid;
    if (valid != stored)
        further_[key + std::string(s_storedSuffix)] = base64(stored);
}

void EntryDocument::addList(const std::vector<const char*>& keys, const std::list<std::string>& stored) {
    auto text = stored.begin();
    for (const char* key : keys)
        if (text == stored.end()) {
            document_[key] = nullptr;
        } else {
            addText(key, utf8FromLatin1(*text), *text);
            ++text;
        }
    if (stored.size() < keys.size())
        further_[s_damage] = fmt::format("{} texts, fewer than its kind has", stored.size());
    bool isUTF8 = true;
    Json bytes;
    for (; text != stored.end(); ++text) {
        further_[s_further].push_back(utf8FromLatin1(*text));
        bytes.push_back(base64(*text));
        isUTF8 = isUTF8 && further_[s_further].back() == *text;
    }
    if (!isUTF8)
        further_[s_further + std::string(s_storedSuffix)] = bytes;
}

Json EntryDocument::finished(double time) {
    document_.update(further_);
    document_[s_time] = numberDocument(time);
    const auto shortTime = static_cast<float>(time);
    if (static_cast<double>(shortTime) != time && !std::isnan(time))
        document_[s_shortTime] = numberDocument(shortTime); // with the digits that tell it from the exact one
    return std::move(document_);
}

std::string damageOf(const Json& entry) {
    if (entry.contains(s_damage))
        return entry[s_damage].get<std::string>();
    const auto image = entry.find(s_image);
    return image != entry.end() && image->is_object() && image->contains(s_damage)
               ? fmt::format("its image {}", (*image)[s_damage].get_ref<const std::string&>())
               : std::string();
}

std::string textLine(const Json& entry) {
    std::string line = entry.contains(s_time) ? timeText(entry[s_time]) : std::string();
    for (const auto& [key, value] : entry.items())
        if (isShownInText(key))
            line += fmt::format("  {}={}", key, value.is_string() ? quoted(bytesOf(entry, key)) : plain(value));
    return line;
}

std::string csvLine(const Json& entry, const EntryKeys& keys) {
    std::string line;
    for (const std::string& key : keys) {
        if (&key != &keys.front())
            line += ',';
        const auto value = entry.find(key);
        if (value != entry.end() && !value->is_null())
            line += csvField(value->is_string() ? shownLines(bytesOf(entry, key)) : plain(*value));
    }
    return line;
}

std::string csvHeader(const EntryKeys& keys) {
    return fmt::format("{}", fmt::join(keys, ","));
}

} // namespace Zulm
