#include "Tools/render/Guide.h"

#include "Reports/Text.h"
#include "Tools/render/KeyCaps.h"
#include "Tools/render/Production.h"
#include "Tools/render/Stills.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <filesystem>

namespace Render {

using namespace ZULMetaData;

namespace {

namespace fs = std::filesystem;

constexpr std::size_t s_longestTitle = 120; ///< bytes
constexpr auto s_htmlName = "guide.html";
constexpr auto s_markdownName = "guide.md";

std::string signOf(Modifier modifier) {
    switch (modifier) {
    case Modifier::CapsLock: return "Caps Lock";
    case Modifier::Shift: return "Shift";
    case Modifier::Control: return "Ctrl";
    case Modifier::Alt: return "Alt";
    case Modifier::Command: return "Cmd";
    case Modifier::Windows: return "Win";
    }
    return {};
}

std::string wordsFor(const Click& click) {
    std::string words;
    if (click.isDrag)
        words =
            click.button == MouseButton::Left ? "Drag" : fmt::format("Drag with the {} button", nameOf(click.button));
    else if (click.count == 2)
        words = "Double-click";
    else if (click.count > 2)
        words = fmt::format("Click {} times", click.count);
    else
        words = click.button == MouseButton::Right    ? "Right-click"
                : click.button == MouseButton::Middle ? "Middle-click"
                                                      : "Click";
    std::string held;
    for (const Modifier modifier : s_modifiers)
        if (click.modifiers.contains(modifier))
            held += (held.empty() ? "" : " and ") + signOf(modifier);
    return held.empty() ? words : fmt::format("{} while you hold {}", words, held);
}

std::string wordsFor(const KeyCaption& caption, bool showsTyped) {
    std::string words;
    bool hidesText = false;
    for (const CaptionPart& part : partsAt(caption, caption.end, true)) {
        const bool isHidden = part.isTyped && !showsTyped;
        if (isHidden && hidesText)
            continue;
        const std::string next = part.isTyped ? (showsTyped ? fmt::format("type “{}”", part.text) : "type the text")
                                              : fmt::format("press {}", part.text);
        hidesText = isHidden;
        words += (words.empty() ? "" : ", then ") + next;
    }
    if (!words.empty() && words.front() >= 'a')
        words.front() = static_cast<char>(words.front() - 'a' + 'A');
    return words;
}

std::string shortened(std::string text) {
    if (text.size() <= s_longestTitle)
        return text;
    std::size_t end = s_longestTitle;
    while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xc0U) == 0x80)
        --end;
    return text.substr(0, end) + "…";
}

std::string whereAt(Timeline& timeline, double time) {
    const Snapshot& state = timeline.at(time);
    const std::string title = shortened(Zulm::readableLine(std::string(state.title.value_or(""))));
    const std::string application = shortened(Zulm::readableLine(std::string(state.application.value_or(""))));
    if (title.empty() || application.empty() || title.find(application) != std::string::npos)
        return title.empty() ? application : title;
    return fmt::format("{} ({})", title, application);
}

std::string escapedHtml(const std::string& text) {
    std::string result;
    for (const char character : text) {
        switch (character) {
        case '&': result += "&amp;"; break;
        case '<': result += "&lt;"; break;
        case '>': result += "&gt;"; break;
        case '"': result += "&quot;"; break;
        default: result += static_cast<unsigned char>(character) < 0x20 ? ' ' : character;
        }
    }
    return result;
}

std::string escapedMarkdown(const std::string& text) {
    std::string result;
    for (const char character : text) {
        if (std::string_view("\\`*_{}[]<>()#+!|&~").find(character) != std::string_view::npos)
            result += '\\';
        result += static_cast<unsigned char>(character) < 0x20 ? ' ' : character;
    }
    return result;
}

std::string pictureName(std::size_t step) {
    return fmt::format("step-{:03}.png", step + 1);
}

std::string sentenceOf(const GuideStep& step) {
    return step.where.empty() ? step.words : fmt::format("{} — {}", step.words, step.where);
}

/// Removes the pictures that an older guide with more steps has left. They may show what is covered by now.
void removeOlderPictures(const fs::path& folder, std::size_t steps) {
    std::error_code ignored;
    for (std::size_t i = steps; fs::remove(folder / pictureName(i), ignored); ++i) {
    }
}

constexpr auto s_htmlHead = R"(<!DOCTYPE html>
<html lang="en">
<head>
<meta charset="utf-8">
<meta name="viewport" content="width=device-width, initial-scale=1">
<meta http-equiv="Content-Security-Policy" content="default-src 'none'; img-src 'self' file:; style-src 'unsafe-inline'">
<title>{0}</title>
<style>
body {{ font: 17px/1.5 system-ui, sans-serif; max-width: 60rem; margin: 2rem auto; padding: 0 1rem; color: #1b1e28; }}
ol {{ padding-left: 1.6rem; }}
li {{ margin-bottom: 2.5rem; }}
img {{ display: block; width: 100%; height: auto; margin-top: .7rem; border-radius: 8px; }}
.where {{ color: #596072; }}
@media (prefers-color-scheme: dark) {{ body {{ background: #14161d; color: #e8eaf0; }} .where {{ color: #a0a7b8; }} }}
</style>
</head>
<body>
<h1>{0}</h1>
<ol>
)";

std::string htmlOf(const std::vector<GuideStep>& steps, const std::string& title) {
    std::string page = fmt::format(s_htmlHead, escapedHtml(title));
    for (std::size_t i = 0; i < steps.size(); ++i) {
        const std::string where =
            steps[i].where.empty() ? "" : fmt::format(" <span class=\"where\">{}</span>", escapedHtml(steps[i].where));
        page += fmt::format("<li>{}{}<img src=\"{}\" alt=\"{}\"></li>\n", escapedHtml(steps[i].words), where,
                            pictureName(i), escapedHtml(sentenceOf(steps[i])));
    }
    return page + "</ol>\n</body>\n</html>\n";
}

std::string markdownOf(const std::vector<GuideStep>& steps, const std::string& title) {
    std::string page = fmt::format("# {}\n", escapedMarkdown(title));
    for (std::size_t i = 0; i < steps.size(); ++i)
        page += fmt::format("\n{}. {}\n\n   ![{}]({})\n", i + 1, escapedMarkdown(sentenceOf(steps[i])),
                            escapedMarkdown(sentenceOf(steps[i])), pictureName(i));
    return page;
}

} // namespace

std::vector<GuideStep> stepsOf(const Recording& recording, double duration, bool showsTyped) {
    const InsightSources sources = insightSourcesOf(recording, [](const Error&) {});
    Timeline timeline(recording, [](const Error&) {});
    std::vector<GuideStep> steps;
    const std::vector<Click> clicks = clicksOf(sources.actions, sources.positions, duration);
    for (std::size_t i = 0; i < clicks.size(); ++i) {
        const bool goesOn = i + 1 < clicks.size() && clicks[i + 1].count > clicks[i].count;
        if (!goesOn && clicks[i].position)
            steps.push_back({clicks[i].start, wordsFor(clicks[i]), {}});
    }
    KeyCaptionOptions options;
    options.showsKeys = showsTyped;
    options.showsShortcuts = true;
    for (const KeyCaption& caption : keyCaptions(sources.keys, options))
        steps.push_back({caption.keys.back().time, wordsFor(caption, showsTyped), {}});
    std::erase_if(steps, [duration](const GuideStep& step) { return step.time < 0 || step.time > duration; });
    std::stable_sort(steps.begin(), steps.end(),
                     [](const GuideStep& left, const GuideStep& right) { return left.time < right.time; });
    for (GuideStep& step : steps)
        step.where = whereAt(timeline, step.time);
    return steps;
}

Zulm::ExitCode makeGuide(const GuideOptions& options) {
    Production production(options);
    if (production.recording().streams().empty())
        return Zulm::complainAboutNoStreams(production.recording());
    production.prepare(production.whole(), "off", 1 << 20);
    const bool showsTyped = production.style().keys.display == KeyDisplay::Shown;
    const std::vector<GuideStep> steps = stepsOf(production.shown(), production.duration(), showsTyped);
    if (steps.empty())
        throw Zulm::Failure(
            fmt::format("{}: has neither clicks nor keys, of which a guide could tell; is it the right recording?",
                        options.recording));
    const fs::path folder(options.folder);
    std::vector<std::string> paths{(folder / s_htmlName).string(), (folder / s_markdownName).string()};
    for (std::size_t i = 0; i < steps.size(); ++i)
        paths.push_back((folder / pictureName(i)).string());
    Zulm::requireFree(paths, options.force);
    const Zulm::NotedSignals noted;
    NewFiles files(options.folder);
    Zulm::Progress progress("drawing the steps of " + options.recording, steps.size(), countText);
    for (std::size_t i = 0; i < steps.size(); ++i) {
        Zulm::NotedSignals::check();
        const FilmTime time = production.session().times().at(steps[i].time);
        writePng(production.composer().stillAt(time), files.add(pictureName(i)), inputsOf(options));
        progress.moveTo(i + 1);
    }
    const std::string title = fs::path(options.recording).stem().string();
    writeNew(files.add(s_htmlName), htmlOf(steps, title), inputsOf(options));
    writeNew(files.add(s_markdownName), markdownOf(steps, title), inputsOf(options));
    files.keep();
    removeOlderPictures(folder, steps.size());
    if (!Zulm::settings().quiet)
        Zulm::writeOutput(
            fmt::format("{}: {} step{}\n", Zulm::shown(options.folder), steps.size(), steps.size() == 1 ? "" : "s"));
    return production.complain();
}

} // namespace Render
