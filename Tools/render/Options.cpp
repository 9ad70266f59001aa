#include "Tools/render/Options.h"

#include "Tools/zulm/Settings.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <charconv>
#include <system_error>

namespace Render {

namespace {

constexpr int s_largestSide = 8192;
constexpr double s_mostGifFps = 50; ///< players show faster ones slower

constexpr auto s_renderFooter =
    R"(Cursor, clicks, keys and zooms are drawn from the metadata of the recording, which the film carries too.

  zulm render Talk.mp4 -o Film.mp4
  zulm render Talk.mp4 -o Film.mp4 --remove-idle --style plain --size 1280x720
  zulm render Talk.mp4 -o Film.gif --gif --keep 10-14
  zulm render Talk.mp4 --frames stills --at 1.5,12)";

FilmSize sizeOf(const std::string& text) {
    FilmSize size;
    const char* end = text.data() + text.size();
    const auto width = std::from_chars(text.data(), end, size.width);
    const bool hasHeight = width.ec == std::errc() && width.ptr != end && *width.ptr == 'x';
    const auto height = hasHeight ? std::from_chars(width.ptr + 1, end, size.height) : width;
    const bool isFine = hasHeight && height.ec == std::errc() && height.ptr == end &&
                        std::min(size.width, size.height) >= 16 && std::max(size.width, size.height) <= s_largestSide &&
                        size.width % 2 == 0 && size.height % 2 == 0;
    if (!isFine)
        throw CLI::ValidationError("--size", fmt::format("'{}' is not of the form WxH, such as 1920x1080, with even "
                                                         "numbers from 16 to {}",
                                                         text, s_largestSide));
    return size;
}

/// Takes finite numbers alone; `CLI::Range` takes "nan" too.
CLI::Validator numberFrom(double least, double most) {
    return {[least, most](const std::string& text) {
                double number = 0;
                const bool isFine = CLI::detail::lexical_cast(text, number) && number >= least && number <= most;
                return isFine ? std::string() : fmt::format("{} is not a number from {} to {}", text, least, most);
            },
            fmt::format("{} to {}", least, most)};
}

void addSourceOptions(CLI::App& app, SourceOptions& options) {
    app.add_option("RECORDING", options.recording, "The recording; - is standard input")->required();
    app.add_option("--style", options.style,
                   fmt::format("A JSON file, or one of these: {}", fmt::join(shippedStyles(), ", ")))
        ->type_name("STYLE");
    app.add_option("--redact", options.redactions,
                   "Cover the rectangles of this JSON file in the picture, and remove what lies there from the streams")
        ->type_name("FILE");
    app.add_option("--keys", options.keys, "Which keys are shown: shown, shortcuts or hidden")
        ->check(CLI::IsMember({"shown", "shortcuts", "hidden"}));
    app.add_option("--cursor-size", options.cursorSize, "How many times larger the cursor is drawn")
        ->check(numberFrom(0.25, 10));
    app.add_flag("--raw-cursor", options.isRaw, "Move the cursor as it was recorded, and do not smooth its way");
    app.add_option("--hide-cursor", options.hideAfter, "Hide a cursor that rests for so many seconds")
        ->check(numberFrom(0.1, 3600));
    app.add_option_function<std::string>(
           "--size", [&options](const std::string& text) { options.size = sizeOf(text); },
           "The size in pixels; that of the movie by default")
        ->type_name("WxH");
    app.add_flag("--force", options.force, "Replace what exists");
    app.add_flag("-q,--quiet", Zulm::settings().quiet, "Print nothing but errors");
    app.add_flag("-v,--verbose", Zulm::settings().verbose, "Say what is done, and how long drawing takes");
    app.add_flag("--no-progress", Zulm::settings().noProgress, "Show no progress");
    app.set_version_flag("--version", ZULM_VERSION);
}

/// Returns false if the words asked for help alone.
bool parse(CLI::App& app, std::vector<std::string> words) {
    std::reverse(words.begin(), words.end()); // the parser takes them from the end
    try {
        app.parse(std::move(words));
    } catch (const CLI::Success& shown) {
        app.exit(shown);
        return false;
    }
    return true;
}

void requireSense(const RenderOptions& options) {
    const int edits = (options.edits.file.empty() ? 0 : 1) + (options.edits.kept.empty() ? 0 : 1) +
                      (options.edits.removed.empty() ? 0 : 1) + (options.removesIdle ? 1 : 0);
    if (edits > 1)
        throw CLI::ValidationError("--edits, --keep, --remove and --remove-idle cannot be given together");
    if (options.frames.empty() != options.at.empty())
        throw CLI::ValidationError("--frames DIR and --at T,T go together");
    if (options.frames.empty() == options.output.empty())
        throw CLI::ValidationError("give either -o OUT or --frames DIR");
    if (options.isGif && !options.frames.empty())
        throw CLI::ValidationError("--gif and --frames cannot be given together");
    if (options.isGif && options.film.fps > s_mostGifFps)
        throw CLI::ValidationError(
            fmt::format("--fps {}: a GIF has at most {} frames a second", options.film.fps, s_mostGifFps));
    const std::string extension = options.isGif ? ".gif" : ".mp4";
    if (options.frames.empty() && !options.output.ends_with(extension))
        throw CLI::ValidationError(fmt::format("{}: the name of the film must end in {}", options.output, extension));
}

} // namespace

std::vector<std::string> inputsOf(const SourceOptions& options) {
    std::vector<std::string> files{options.recording};
    if (!isShippedStyle(options.style))
        files.push_back(options.style);
    if (!options.redactions.empty())
        files.push_back(options.redactions);
    if (!options.zoom.empty() && options.zoom != "auto" && options.zoom != "off")
        files.push_back(options.zoom);
    return files;
}

std::vector<std::string> inputsOf(const RenderOptions& options) {
    std::vector<std::string> files = inputsOf(static_cast<const SourceOptions&>(options));
    if (!options.edits.file.empty())
        files.push_back(options.edits.file);
    return files;
}

std::optional<RenderOptions> renderOptionsOf(std::vector<std::string> words) {
    RenderOptions options;
    CLI::App app("Make a film of a recording, with its cursor, clicks and keys drawn into the picture", "zulm render");
    app.footer(s_renderFooter);
    addSourceOptions(app, options);
    app.add_option("-o,--output", options.output, "The film to make")->type_name("OUT");
    Zulm::addEditOptions(app, options.edits);
    CLI::Option* idle = app.add_flag("--remove-idle", options.removesIdle, "Cut long spans without activity to a rest");
    app.add_option("--idle-least", options.idleLeast, "How many seconds such a span has at least, 5 by default")
        ->check(numberFrom(0.1, 1e6))
        ->needs(idle);
    app.add_option("--idle-rest", options.idleRest, "How many seconds are left of such a span, 1 by default")
        ->check(numberFrom(0, 1e6))
        ->needs(idle);
    app.add_option("--zoom", options.zoom, "auto, off, or a JSON file of zooms")->type_name("auto|off|FILE");
    CLI::Option* fps = app.add_option("--fps", options.film.fps, "Frames a second, 30 by default and 12 for --gif")
                           ->check(numberFrom(1, 120));
    app.add_option("--codec", options.film.codec, "An encoder of libavcodec, h264 by default");
    CLI::Option* quality = app.add_option("--quality", options.film.quality, "From 0, the best, to 51; 20 by default")
                               ->check(CLI::Range(0, 51));
    app.add_flag("--no-sound", options.isSilent, "Leave the sound out");
    app.add_flag("--gif", options.isGif, "Make an animated GIF");
    app.add_option("--frames", options.frames, "Write single frames as PNG files into this folder")->type_name("DIR");
    app.add_option("--at", options.at, "The times of these frames in seconds of the film")
        ->type_name("T,T")
        ->delimiter(',')
        ->check(numberFrom(0, 1e7));
    if (!parse(app, std::move(words)))
        return std::nullopt;
    options.hasFps = fps->count() > 0;
    options.film.isQualityAsked = quality->count() > 0;
    requireSense(options);
    return options;
}

std::optional<GuideOptions> guideOptionsOf(std::vector<std::string> words) {
    GuideOptions options;
    CLI::App app("Make a guide of a recording: a step for each click, with a picture and words", "zulm guide");
    app.footer("  zulm guide Talk.mp4 -o guide");
    addSourceOptions(app, options);
    app.add_option("-o,--output", options.folder, "The folder to make")->type_name("DIR")->required();
    if (!parse(app, std::move(words)))
        return std::nullopt;
    return options;
}

} // namespace Render
