#include "Tools/render/Style.h"

#include "Tools/render/JsonFields.h"
#include "Tools/render/ShippedStyles.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <utility>

namespace Render {

using Zulm::Failure;

namespace {

std::optional<Colour> colourOf(const std::string& text) {
    const bool isHex = text.size() > 1 && text.find_first_not_of("0123456789abcdefABCDEF", 1) == std::string::npos;
    if (!isHex || text[0] != '#' || (text.size() != 7 && text.size() != 9))
        return std::nullopt;
    const auto part = [&text](std::size_t place) { return std::stoi(text.substr(place, 2), nullptr, 16) / 255.0; };
    return Colour{part(1), part(3), part(5), text.size() == 9 ? part(7) : 1};
}

enum class Opacity : std::uint8_t { Full, Any };

void readColour(JsonFields& fields, const std::string& path, Colour& result, Opacity opacity = Opacity::Any) {
    std::string text;
    fields.text(path, text);
    if (!fields.has(path))
        return;
    const auto colour = colourOf(text);
    if (opacity == Opacity::Full && (!colour || text.size() > 7))
        fields.failAt(path, "must be a colour such as \"#3d7bff\"");
    if (!colour)
        fields.failAt(path, "must be a colour such as \"#3d7bff\", or \"#3d7bff80\" with its opacity");
    result = *colour;
}

void readBackground(JsonFields& reader, Style::Background& background) {
    reader.section("background");
    if (reader.has("background.color"))
        background.to.reset();
    readColour(reader, "background.color", background.from, Opacity::Full);
    if (reader.has("background.to")) {
        if (!reader.has("background.color"))
            reader.failAt("background.to", "needs \"background.color\", the other end of the gradient");
        background.to.emplace();
        readColour(reader, "background.to", *background.to, Opacity::Full);
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

/// Returns the style with what a document changes.
Style changed(Style style, std::string_view document, const std::string& file) {
    JsonFields reader(document, file, "zulm.style");
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

} // namespace

std::optional<KeyDisplay> keyDisplayOf(const std::string& name) {
    if (name == "shown")
        return KeyDisplay::Shown;
    if (name == "shortcuts")
        return KeyDisplay::Shortcuts;
    return name == "hidden" ? std::optional(KeyDisplay::Hidden) : std::nullopt;
}

Style readStyle(std::string_view document, const std::string& file) {
    return changed(changed({}, s_productStyle, "product"), document, file);
}

Style styleOf(const std::string& name) {
    if (isShippedStyle(name))
        return readStyle(name == "plain" ? s_plainStyle : s_productStyle, name);
    if (name.find('/') == std::string::npos && !name.ends_with(".json"))
        throw Failure(
            fmt::format("{}: no style has this name; there are {}, and files whose names end in .json or have "
                        "a slash",
                        name, fmt::join(s_shippedStyles, ", ")));
    return readStyle(shortFile(name, "a style"), name);
}

} // namespace Render
