#include "Tools/render/Style.h"

#include "Tools/render/JsonFields.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <filesystem>

namespace Render {

using Zulm::Failure;

namespace {

namespace fs = std::filesystem;

std::optional<Colour> colourOf(const std::string& text) {
    const bool isHex = text.size() > 1 && text.find_first_not_of("0123456789abcdefABCDEF", 1) == std::string::npos;
    if (!isHex || text[0] != '#' || (text.size() != 7 && text.size() != 9))
        return std::nullopt;
    const auto part = [&text](std::size_t place) { return std::stoi(text.substr(place, 2), nullptr, 16) / 255.0; };
    return Colour{part(1), part(3), part(5), text.size() == 9 ? part(7) : 1};
}

void readColour(JsonFields& fields, const std::string& path, Colour& result) {
    std::string text;
    fields.text(path, text);
    if (!fields.has(path))
        return;
    const auto colour = colourOf(text);
    if (!colour)
        fields.failAt(path, "must be a colour such as \"#3d7bff\", or \"#3d7bff80\" with its opacity");
    result = *colour;
}

void readBackground(JsonFields& reader, Style::Background& background) {
    reader.section("background");
    readColour(reader, "background.color", background.from);
    if (reader.has("background.to")) {
        if (!reader.has("background.color"))
            reader.failAt("background.to", "needs \"background.color\", the other end of the gradient");
        background.to.emplace();
        readColour(reader, "background.to", *background.to);
    }
    reader.number("background.angle", -360, 360, background.angle);
}

void readFrame(JsonFields& reader, Style::Frame& frame) {
    reader.section("frame");
    reader.number("frame.padding", 0, 400, frame.padding);
    reader.number("frame.corner_radius", 0, 400, frame.cornerRadius);
    reader.number("frame.shadow_blur", 0, 200, frame.shadowBlur);
    reader.number("frame.shadow_offset", -200, 200, frame.shadowOffset);
    reader.number("frame.shadow_opacity", 0, 1, frame.shadowOpacity);
}

void readKeys(JsonFields& reader, Style::Keys& keys) {
    reader.section("keys");
    std::string display;
    reader.text("keys.display", display);
    if (reader.has("keys.display")) {
        const auto named = keyDisplayOf(display);
        if (!named)
            reader.failAt("keys.display", R"(must be one of "shown", "shortcuts", "hidden")");
        keys.display = *named;
    }
    reader.number("keys.size", 6, 200, keys.size);
    reader.text("keys.font", keys.font);
    readColour(reader, "keys.color", keys.colour);
    readColour(reader, "keys.background", keys.background);
}

fs::path styleFolder() {
    std::error_code error;
    const fs::path own = fs::read_symlink("/proc/self/exe", error);
    const fs::path installed = own.parent_path().parent_path() / "share" / "zulm" / "styles";
    return !error && fs::is_directory(installed, error) ? installed : fs::path(ZULM_STYLES);
}

} // namespace

std::optional<KeyDisplay> keyDisplayOf(const std::string& name) {
    if (name == "shown")
        return KeyDisplay::Shown;
    if (name == "shortcuts")
        return KeyDisplay::Shortcuts;
    return name == "hidden" ? std::optional(KeyDisplay::Hidden) : std::nullopt;
}

Style readStyle(std::string_view document, const std::string& file) {
    JsonFields reader(document, file, "zulm.style");
    Style style;
    std::string comment;
    reader.text("name", comment);
    readBackground(reader, style.background);
    readFrame(reader, style.frame);
    reader.section("cursor");
    reader.number("cursor.size", 0.25, 10, style.cursor.size);
    reader.boolean("cursor.smooth", style.cursor.isSmooth);
    reader.number("cursor.hide_after", 0.1, 3600, style.cursor.hideAfter);
    reader.section("clicks");
    reader.boolean("clicks.show", style.clicks.isShown);
    readColour(reader, "clicks.color", style.clicks.colour);
    reader.number("clicks.radius", 2, 300, style.clicks.radius);
    reader.number("clicks.duration", 0.05, 5, style.clicks.duration);
    readKeys(reader, style.keys);
    reader.section("zoom");
    reader.boolean("zoom.auto", style.zoom.isAutomatic);
    reader.number("zoom.factor", 1, 8, style.zoom.factor);
    reader.number("zoom.settle_time", 0.05, 10, style.zoom.settleTime);
    reader.boolean("zoom.follow_cursor", style.zoom.followsCursor);
    reader.requireNothingLeft();
    return style;
}

std::vector<std::string> installedStyles() {
    std::vector<std::string> names;
    std::error_code error;
    for (const fs::directory_entry& entry : fs::directory_iterator(styleFolder(), error))
        if (entry.path().extension() == ".json")
            names.push_back(entry.path().stem().string());
    std::sort(names.begin(), names.end());
    return names;
}

Style styleOf(const std::string& name) {
    std::error_code error;
    if (fs::is_regular_file(name, error))
        return readStyle(shortFile(name, "a style"), name);
    const std::vector<std::string> names = installedStyles();
    if (std::find(names.begin(), names.end(), name) == names.end())
        throw Failure(fmt::format("{}: neither a file nor a style that is installed; these are: {}", name,
                                  fmt::join(names, ", ")));
    const fs::path file = styleFolder() / (name + ".json");
    return readStyle(shortFile(file.string(), "a style"), file.string());
}

} // namespace Render
