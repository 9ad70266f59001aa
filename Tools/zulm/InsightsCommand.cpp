#include "Reports/Number.h"
#include "Reports/Report.h"
#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataSession/Insights/Insights.h"

#include <fmt/core.h>

#include <algorithm>
#include <memory>
#include <optional>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

constexpr double s_largestZoom = 100;

struct InsightsCommandOptions {
    std::vector<std::string> files;
    InsightOptions insights;
    std::optional<double> idle;
    std::optional<double> chapter;
    bool json = false;
};

/// The kinds of which insights are made.
const std::vector<std::string>& insightKinds() {
    static const std::vector<std::string> names{"cursorAction",    "cursorLocation",     "keyboardAction",
                                                "recordingRegion", "scrollAction",       "slideTitles",
                                                "topmostAppName",  "topmostWindowTitle", "topmostWindow"};
    return names;
}

// ---- JSON -----------------------------------------------------------------------------------------------------

Json pointDocument(const std::optional<Point>& point) {
    return point ? Json{{"x", point->x}, {"y", point->y}} : Json(nullptr);
}

Json rectDocument(const ScreenRect& rect) {
    return {{"x", rect.x}, {"y", rect.y}, {"width", rect.width}, {"height", rect.height}};
}

Json clickDocument(const Click& click) {
    Json document{{"start", click.start}, {"end", click.end}, {"button", nameOf(click.button)}};
    document["modifiers"] = Json::array();
    for (const Modifier modifier : s_modifiers)
        if (click.modifiers.contains(modifier))
            document["modifiers"].push_back(nameOf(modifier));
    document.update(Json{{"position", pointDocument(click.position)},
                         {"end_position", pointDocument(click.endPosition)},
                         {"count", click.count},
                         {"drag", click.isDrag},
                         {"released", click.isReleased}});
    return document;
}

Json captionDocument(const KeyCaption& caption) {
    Json document{{"start", caption.start}, {"end", caption.end}, {"text", caption.text}};
    document["keys"] = Json::array();
    for (const CaptionKey& key : caption.keys)
        document["keys"].push_back({{"time", key.time}, {"label", key.label}, {"typed", key.isTyped}});
    return document;
}

const char* sourceText(ChapterSource source) {
    switch (source) {
    case ChapterSource::Slide: return "slide";
    case ChapterSource::WindowTitle: return "window";
    case ChapterSource::Application: return "application";
    default: return "nothing";
    }
}

Json chapterDocument(const Chapter& chapter) {
    Json document{{"start", chapter.start}, {"end", chapter.end}};
    addText(document, "title", chapter.title);
    addText(document, "application", chapter.application);
    document["source"] = sourceText(chapter.source);
    return document;
}

const char* reasonText(ZoomReason reason) {
    return reason == ZoomReason::Clicks ? "clicks" : "typing";
}

Json zoomDocument(const Zoom& zoom) {
    Json document{{"start", zoom.start}, {"end", zoom.end}, {"factor", zoom.factor}};
    document["places"] = Json::array();
    for (const ZoomPlace& place : zoom.places)
        document["places"].push_back(
            {{"start", place.start}, {"reason", reasonText(place.reason)}, {"area", rectDocument(place.area)}});
    return document;
}

void write(JsonWriter& writer, const Insights& insights) {
    writer.member("duration", insights.duration);
    writer.member("screen", insights.screen.width > 0 ? rectDocument(insights.screen) : Json(nullptr));
    writer.array("clicks", insights.clicks, clickDocument);
    writer.array("captions", insights.captions, captionDocument);
    writer.array("idle", insights.idle, [](const IdleSpan& span) {
        return Json{{"start", span.start}, {"end", span.end}};
    });
    writer.array("chapters", insights.chapters, chapterDocument);
    writer.array("zooms", insights.zooms, zoomDocument);
}

// ---- Text -----------------------------------------------------------------------------------------------------

std::string counted(std::size_t count, const std::string& thing) {
    return fmt::format("{} {}{}", count, thing, count == 1 ? "" : "s");
}

std::string clickText(const Click& click) {
    std::string text;
    for (const Modifier modifier : s_modifiers)
        if (click.modifiers.contains(modifier))
            text += std::string(nameOf(modifier)) + ' ';
    text += nameOf(click.button);
    if (click.isDrag)
        text += " drag";
    if (click.position)
        text += fmt::format(" at {},{}", click.position->x, click.position->y);
    if (click.isDrag && click.endPosition)
        text += fmt::format(" to {},{}", click.endPosition->x, click.endPosition->y);
    if (click.count > 1)
        text += fmt::format(", click {} in a row", click.count);
    return click.isReleased ? text : text + ", release not recorded";
}

std::string chapterText(const Chapter& chapter) {
    const bool namesApplication = chapter.source != ChapterSource::Application && !chapter.application.empty();
    return shown(chapter.title) + (namesApplication ? fmt::format(" ({})", shown(chapter.application)) : "");
}

std::string zoomText(const Zoom& zoom) {
    std::string text = fmt::format("{:g} times", zoom.factor);
    for (const ZoomPlace& place : zoom.places)
        text += fmt::format("{} {} around {:.0f},{:.0f}", &place == &zoom.places.front() ? ":" : ", then",
                            reasonText(place.reason), place.centre.x, place.centre.y);
    return text;
}

/// Prints a table with the times and a text of each item, unless there is none.
template <class Items, class TextOf>
void printTable(const std::string& title, const Items& items, TextOf textOf) {
    if (items.empty())
        return;
    writeOutput(heading(fmt::format("  {:>10}  {:>10}  {}", "start s", "end s", title)) + '\n');
    for (const auto& item : items) {
        std::string line = fmt::format("  {:>10.3f}  {:>10.3f}  {}", item.start, item.end, textOf(item));
        line.erase(line.find_last_not_of(' ') + 1);
        writeOutput(line + '\n');
    }
}

void print(const std::string& name, const Insights& insights) {
    double idle = 0;
    for (const IdleSpan& span : insights.idle)
        idle += span.end - span.start;
    writeOutput(fmt::format("{}: {:.3f} s, {}, {:.3f} s idle, {}, {}\n", shown(name), insights.duration,
                            counted(insights.clicks.size(), "click"), idle,
                            counted(insights.chapters.size(), "chapter"), counted(insights.zooms.size(), "zoom")));
    printTable("clicks", insights.clicks, clickText);
    printTable("keys", insights.captions, [](const KeyCaption& caption) { return shown(caption.text); });
    printTable("idle time", insights.idle,
               [](const IdleSpan& span) { return fmt::format("{:.3f} s", span.end - span.start); });
    printTable("chapters", insights.chapters, chapterText);
    printTable("zooms", insights.zooms, zoomText);
}

// ---- The command ----------------------------------------------------------------------------------------------

/// Reads the tracks of one file.
class SourceReader {
public:
    explicit SourceReader(RecordingFile& file) : file_(file) {}

    /// Complains about everything that cannot be read.
    InsightSources read() {
        for (const StreamInfo& stream : chosenStreams(file_, insightKinds()))
            if (isDecodable(file_.examine(stream).header()))
                note(complainAboutRest(file_, stream, file_.examine(stream).readableBytes));
        const Recording recording(file_.bytes(), file_.name());
        InsightSources sources = insightSourcesOf(recording, [this](const Error& error) {
            if (error.code())
                throw error;
            complain(error.what());
            note(ExitDamaged);
        });
        complainAboutTimes(sources);
        return sources;
    }

    ExitCode code() const { return code_; }

private:
    void note(ExitCode code) { code_ = worseOf(code_, code); }

    void complainAboutTimes(const InsightSources& sources) {
        const auto complainAbout = [this]<class Kind>(const Track<Kind>& track) {
            if (track.leftOut() == 0)
                return;
            complain(fmt::format("{}: {}: left out {} at no time", file_.name(), metaDataKindName(Kind::type),
                                 track.leftOut() == 1 ? "1 entry" : fmt::format("{} entries", track.leftOut())));
            note(ExitDamaged);
        };
        complainAbout(sources.actions);
        complainAbout(sources.keys);
        complainAbout(sources.positions);
        complainAbout(sources.scrolling);
        complainAbout(sources.slides);
        complainAbout(sources.applications);
        complainAbout(sources.titles);
        complainAbout(sources.windows);
    }

    RecordingFile& file_;
    ExitCode code_ = ExitFine;
};

ExitCode showInsights(const std::string& path, const InsightOptions& options, RunReport& report) {
    const InputFile input(path);
    RecordingFile file = input.open();
    if (file.streams().empty())
        return complainAboutNothing(file, {});
    if (chosenStreams(file, insightKinds()).empty())
        return complainAboutNothing(file, insightKinds());
    SourceReader reader(file);
    const Insights insights = insightsOf(reader.read(), options);
    if (!insights.clicks.empty() && insights.screen.width <= 0)
        warn(fmt::format("{}: has no stream {}, so it is not known where to zoom in", file.name(),
                         metaDataKindName(RecordingRegionKind::type)));
    if (report.isWanted())
        write(report.beginFile(file.name()), insights);
    else
        print(file.name(), insights);
    return reader.code();
}

double requireFactor(const std::string& word) {
    const std::optional<double> factor = realNumber(word);
    if (!factor || !(*factor >= 1 && *factor <= s_largestZoom))
        throw CLI::ValidationError("--zoom", fmt::format("{} is not a number from 1 to {}", word, s_largestZoom));
    return *factor;
}

} // namespace

void addInsightsCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<InsightsCommandOptions>();
    CLI::App* command = app.add_subcommand(
        "insights", "Show what happens in a recording: clicks, keys, idle time, chapters, and where an editor should "
                    "zoom in; what was typed shows as bullets");
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files; - is standard input")->required();
    addSeconds(*command, "--idle", options->idle, "The shortest idle time; the default is 5 seconds");
    addSeconds(*command, "--chapter", options->chapter, "The shortest chapter; the default is 10 seconds");
    command
        ->add_option_function<std::string>(
            "--zoom", [options](const std::string& word) { options->insights.zooms.factor = requireFactor(word); },
            "How many times larger the picture appears in a zoom; the default is 1.5")
        ->type_name("FACTOR");
    command->add_flag("--show-keys", options->insights.captions.showsKeys, "Show what was typed, passwords included");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm insights Recording.mp4\nzulm insights --json --zoom 2 Recording.mp4");
    command->callback([options, &chosen] {
        InsightOptions& insights = options->insights;
        insights.idle.least = options->idle.value_or(insights.idle.least);
        insights.chapters.least = options->chapter.value_or(insights.chapters.least);
        chosen = reportingOnEach("insights", options->json, options->files,
                                 [options](const std::string& file, RunReport& report) {
                                     return showInsights(file, options->insights, report);
                                 });
    });
}

} // namespace Zulm
