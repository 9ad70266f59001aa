#include "Reports/Number.h"
#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/Timeline.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct StateOptions {
    std::string file;
    std::vector<double> times;
    Interpolation interpolation = Interpolation::Linear;
    bool json = false;
};

// ---- What holds, as JSON --------------------------------------------------------------------------------------

/// Returns what `documentOf` makes of a value, or null if there is none.
template <class Value, class DocumentOf>
Json orNull(const std::optional<Value>& value, DocumentOf documentOf) {
    return value ? Json(documentOf(*value)) : Json(nullptr);
}

/// A coordinate without a fraction shows as it is stored.
Json coordinate(double value) {
    return std::trunc(value) == value ? Json(static_cast<std::int64_t>(value)) : Json(value);
}

Json pointDocument(const ScreenPoint& point) {
    return {{"x", coordinate(point.x)}, {"y", coordinate(point.y)}};
}

Json rectDocument(const Rect& rect) {
    return {{"x", rect.x}, {"y", rect.y}, {"width", rect.width}, {"height", rect.height}};
}

Json cursorImageDocument(const CursorAppearance* cursor) {
    if (!cursor)
        return nullptr;
    Json image{{"id", std::to_string(cursor->id)}, {"hotspot_x", nullptr}, {"hotspot_y", nullptr}, {"bytes", nullptr}};
    if (const CursorPicture* picture = cursor->picture.get()) {
        image["hotspot_x"] = picture->hotSpot.x;
        image["hotspot_y"] = picture->hotSpot.y;
        image["bytes"] = picture->bytes.size();
    }
    return image;
}

/// Returns the names of what is in a set, in the order of `all`.
template <class Enum, std::size_t Count>
std::vector<std::string_view> heldNames(EnumSet<Enum> set, const std::array<Enum, Count>& all) {
    std::vector<std::string_view> names;
    for (const Enum value : all)
        if (set.contains(value))
            names.push_back(nameOf(value));
    return names;
}

void addTextOrNull(Json& document, const std::string& key, const std::optional<std::string_view>& text) {
    if (text)
        addText(document, key, std::string(*text));
    else
        document[key] = nullptr;
}

Json slideDocument(const Slide& slide) {
    if (!slide.isKnown())
        return nullptr;
    Json document;
    addTextOrNull(document, "title", slide.title);
    addTextOrNull(document, "text", slide.text);
    addTextOrNull(document, "comment", slide.comment);
    return document;
}

/// A number of 32 bits has the digits that tell it from others of 32 bits.
Json shortNumberDocument(float number) {
    return numberDocument(std::isfinite(number) ? shortestNumber(number) : static_cast<double>(number));
}

Json stateDocument(const Snapshot& state) {
    Json document{{"time", state.time}};
    document["cursor"] = orNull(state.cursor, pointDocument);
    document["cursor_image"] = cursorImageDocument(state.appearance);
    document["opacity"] = numberDocument(state.opacity);
    document["buttons"] =
        orNull(state.buttons, [](MouseButtons buttons) { return heldNames(buttons, s_mouseButtons); });
    document["modifiers"] = orNull(state.modifiers, [](Modifiers held) { return heldNames(held, s_modifiers); });
    document["window"] = orNull(state.window, rectDocument);
    addTextOrNull(document, "title", state.title);
    addTextOrNull(document, "application", state.application);
    document["slide"] = slideDocument(state.slide);
    document["hover"] = orNull(state.hover, rectDocument);
    document["region"] = orNull(state.region, rectDocument);
    document["scale"] = orNull(state.scale, [](std::int32_t scale) { return scale; });
    document["cpu"] = orNull(state.cpu, shortNumberDocument);
    return document;
}

// ---- What holds, for people -----------------------------------------------------------------------------------

/// What is known, one line for each value.
class StatePage {
public:
    void add(const char* label, const std::string& text) { lines_ += fmt::format("  {:<13}{}\n", label, text); }

    void add(const char* label, const std::optional<std::string_view>& text) {
        if (text)
            add(label, shown(*text));
    }

    void add(const char* label, const std::optional<Rect>& rect) {
        if (rect)
            add(label, fmt::format("{} x {} at {}, {}", rect->width, rect->height, rect->x, rect->y));
    }

    template <class Number>
    void addNumber(const char* label, const std::optional<Number>& number) {
        if (number)
            add(label, fmt::format("{}", *number));
    }

    template <class Enum, std::size_t Count>
    void addNames(const char* label, const std::optional<EnumSet<Enum>>& held, const std::array<Enum, Count>& all) {
        if (held)
            add(label, held->empty() ? "none" : fmt::format("{}", fmt::join(heldNames(*held, all), ", ")));
    }

    const std::string& lines() const { return lines_; }

private:
    std::string lines_;
};

std::string cursorImageText(const CursorAppearance& cursor) {
    if (!cursor.picture)
        return fmt::format("picture {}, which is not in the recording", cursor.id);
    const Point& hotSpot = cursor.picture->hotSpot;
    return fmt::format("picture {} of {} bytes, hot spot {}, {}", cursor.id, cursor.picture->bytes.size(), hotSpot.x,
                       hotSpot.y);
}

void printState(const std::string& name, const Snapshot& state) {
    StatePage page;
    if (state.cursor)
        page.add("cursor", fmt::format("{:.6g}, {:.6g}", state.cursor->x, state.cursor->y));
    if (state.appearance)
        page.add("shape", cursorImageText(*state.appearance));
    page.addNumber("opacity", state.opacity);
    page.addNames("buttons", state.buttons, s_mouseButtons);
    page.addNames("modifiers", state.modifiers, s_modifiers);
    page.add("window", state.window);
    page.add("title", state.title);
    page.add("application", state.application);
    page.add("slide", state.slide.title);
    page.add("slide text", state.slide.text);
    page.add("comment", state.slide.comment);
    page.add("hover", state.hover);
    page.add("region", state.region);
    page.addNumber("scale", state.scale);
    page.addNumber("cpu", state.cpu);
    writeOutput(heading(fmt::format("{} at {} s", shown(name), state.time)) + '\n');
    writeOutput(page.lines().empty() ? "  nothing is known yet\n" : page.lines());
}

// ---- The command ----------------------------------------------------------------------------------------------

ExitCode showStates(const StateOptions& options, RunReport& report) {
    const InputFile input(options.file);
    const Recording recording = input.openSession();
    if (recording.streams().empty())
        return complainAboutNothing(recording.name(), {});
    Timeline timeline(
        recording,
        [&recording](const Error& error) {
            if (error.code())
                throw error; // what holds would be said to be unknown
            warn(fmt::format("{}: {}", recording.name(), error.sentence()));
        },
        options.interpolation);
    if (report.isWanted())
        report.beginFile(recording.name()).beginArray("states");
    for (std::size_t i = 0; i < options.times.size(); ++i) {
        const Snapshot& state = timeline.at(options.times[i]);
        if (report.isWanted()) {
            report.writer().element(stateDocument(state));
            continue;
        }
        if (i > 0)
            writeOutput("\n");
        printState(recording.name(), state);
    }
    return ExitFine;
}

double requireEditTime(const std::string& word) {
    const std::optional<Rational> time = parseEditTime(word);
    const double seconds = time ? time->nearest() : 0;
    if (!time || !std::isfinite(seconds))
        throw CLI::ValidationError(
            "--at",
            fmt::format("'{}' is not a time; give seconds (90, 12.5, 61/3) or a time code (1:30, 0:01:02.5)", word));
    return seconds;
}

std::vector<double> timesIn(const std::string& list) {
    std::vector<double> times;
    for (std::size_t begin = 0; begin <= list.size();) {
        const std::size_t end = std::min(list.find(',', begin), list.size());
        times.push_back(requireEditTime(list.substr(begin, end - begin)));
        begin = end + 1;
    }
    return times;
}

} // namespace

void addStateCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<StateOptions>();
    CLI::App* command = app.add_subcommand(
        "state", "Show everything that holds at given times: cursor, buttons, window, slide and the rest");
    command->add_option("RECORDING", options->file, "A movie, RIFF file or stream file; - is standard input")
        ->required();
    command
        ->add_option_function<std::string>(
            "--at", [options](const std::string& list) { options->times = timesIn(list); },
            "The times, separated by commas, in seconds (12.5, 61/3) or as time codes (1:30)")
        ->type_name("T[,T...]")
        ->required();
    addChoice(*command, "--interpolate", options->interpolation,
              "Where the cursor is between two entries: where the first one says (none), or on a straight line between "
              "them (linear, unless it is given); it rests for as long as nothing was recorded",
              {{"none", Interpolation::Held}, {"linear", Interpolation::Linear}});
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm state Recording.mp4 --at 12.5\n"
                    "zulm state Recording.mp4 --at 0:10,0:20,0:30 --json");
    command->callback([options, &chosen] {
        chosen = reporting("state", options->json, {options->file},
                           [options](RunReport& report) { return showStates(*options, report); });
    });
}

} // namespace Zulm
