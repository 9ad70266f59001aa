#include "Tools/render/Options.h"

#include "Tools/render/ShippedStyles.h"
#include "Tools/zulm/Choice.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <charconv>
#include <system_error>

namespace Render {

namespace {

constexpr int s_largestSide = 8192;
constexpr double s_mostGifFps = 50; ///< players show faster ones slower
constexpr double s_longest = 1e7;   ///< seconds of a recording, and of a film

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
            ""};
}

/// Adds an option whose value is a time in seconds or a time code.
template <class Seconds>
CLI::Option* addSeconds(CLI::App& command, const std::string& name, Seconds& value, double least, double most,
                        const std::string& description) {
    const auto read = [name, &value, least, most](const std::string& word) {
        const double seconds = Zulm::requireSeconds(name, word);
        if (seconds < least || seconds > most)
            throw CLI::ValidationError(name, fmt::format("{} is not from {} to {} seconds", word, least, most));
        value = seconds;
    };
    return command.add_option_function<std::string>(name, read, description)->type_name("TIME");
}

void addSourceOptions(CLI::App& command, SourceOptions& options) {
    command.add_option("RECORDING", options.recording, "The recording; - is standard input")->required();
    command
        .add_option("--style", options.style,
                    fmt::format("How everything looks: a JSON file, or one of {}; product unless it is given",
                                fmt::join(s_shippedStyles, ", ")))
        ->type_name("FILE");
    command
        .add_option(
            "--redact", options.redactions,
            "Cover the rectangles of this JSON file in the picture, and remove what lies there from the streams")
        ->type_name("FILE");
    Zulm::addChoice<std::string>(
        command, "--keys", options.keys,
        "Which keys are shown; as the style says unless it is given. With shown, passwords that were typed are shown "
        "too",
        {{"shown", "shown"}, {"shortcuts", "shortcuts"}, {"hidden", "hidden"}});
    command
        .add_option("--cursor-size", options.cursorSize, "How many times larger the cursor is drawn, from 0.25 to 10")
        ->type_name("N")
        ->check(numberFrom(0.25, 10));
    command.add_flag("--raw-cursor", options.isRaw, "Move the cursor as it was recorded, and do not smooth its way");
    addSeconds(command, "--hide-cursor", options.hideAfter, 0.1, 3600, "Hide a cursor that has rested for this time");
    command
        .add_option_function<std::string>(
            "--size", [&options](const std::string& text) { options.size = sizeOf(text); },
            "The size in pixels; that of the movie unless it is given")
        ->type_name("WxH");
}

void addIdleOptions(CLI::App& command, RenderOptions& options) {
    CLI::Option* idle =
        command.add_flag("--remove-idle", options.removesIdle, "Cut long spans without activity to a rest")
            ->excludes("--edits")
            ->excludes("--keep")
            ->excludes("--remove");
    addSeconds(command, "--idle-least", options.idleLeast, 0.1, s_longest,
               "How long such a span is at least; 5 unless it is given")
        ->needs(idle);
    addSeconds(command, "--idle-rest", options.idleRest, 0, s_longest,
               "How much is left of such a span; 1 unless it is given")
        ->needs(idle);
}

void addFilmOptions(CLI::App& command, RenderOptions& options) {
    command
        .add_option(
            "--zoom", options.zoom,
            "When the camera zooms in: auto, off, or a JSON file of zooms; as the style says unless it is given")
        ->type_name("FILE");
    command
        .add_option("--fps", options.fps,
                    "Frames a second, from 1 to 120; 30 unless it is given, and 12 with --gif, which takes up to 50")
        ->type_name("N")
        ->check(numberFrom(1, 120));
    command.add_option("--codec", options.codec, "An encoder of libavcodec; h264 unless it is given")
        ->type_name("NAME");
    command.add_option("--quality", options.quality, "From 0, the best, to 51; 20 unless it is given")
        ->type_name("N")
        ->check(CLI::Range(0, 51).description(""));
    command.add_flag("--no-sound", options.isSilent, "Leave the sound out");
}

void addKindOptions(CLI::App& command, RenderOptions& options) {
    CLI::Option* gif = command.add_flag("--gif", options.isGif, "Make an animated GIF");
    CLI::Option* frames =
        command.add_option("--frames", options.frames, "Write single frames as PNG files into this folder")
            ->type_name("DIR")
            ->excludes(gif)
            ->excludes("--output");
    CLI::Option* at = command
                          .add_option_function<std::vector<std::string>>(
                              "--at",
                              [&options](const std::vector<std::string>& words) {
                                  options.at.clear();
                                  for (const std::string& word : words)
                                      options.at.push_back(Zulm::requireSeconds("--at", word));
                              },
                              "The times of these frames in the film")
                          ->type_name("TIME,TIME")
                          ->delimiter(',')
                          ->allow_extra_args(false) // or it takes the recording
                          ->needs(frames);
    frames->needs(at);
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

CLI::App* addRenderOptions(CLI::App& app, RenderOptions& options) {
    CLI::App* command = app.add_subcommand(
        "render", "Make a film of a recording. The cursor, clicks, keys and zooms are drawn into its pictures from the "
                  "metadata, which the film carries too");
    addSourceOptions(*command, options);
    command
        ->add_option("-o,--output", options.output, "The film to make, whose name ends in .mp4, or in .gif with --gif")
        ->type_name("OUT");
    command->add_flag("--force", options.force, "Replace OUT, or the frames in DIR, if they exist");
    Zulm::addEditOptions(*command, options.edits);
    addIdleOptions(*command, options);
    addFilmOptions(*command, options);
    addKindOptions(*command, options);
    command->footer("zulm render Talk.mp4 -o Film.mp4\n"
                    "zulm render Talk.mp4 -o Film.mp4 --remove-idle --style plain --size 1280x720\n"
                    "zulm render Talk.mp4 -o Film.gif --gif --keep 10-14\n"
                    "zulm render Talk.mp4 --frames stills --at 1.5,12");
    return command;
}

CLI::App* addGuideOptions(CLI::App& app, GuideOptions& options) {
    CLI::App* command = app.add_subcommand(
        "guide", "Make a guide of a recording: a folder with a step for each click and for the keys, "
                 "each with a picture and words, as HTML and Markdown");
    addSourceOptions(*command, options);
    command->add_option("-o,--output", options.folder, "The folder to make")->type_name("DIR")->required();
    command->add_flag("--force", options.force, "Replace the guide in DIR if there is one");
    command->footer("zulm guide Talk.mp4 -o guide");
    return command;
}

void requireSense(const RenderOptions& options) {
    const Zulm::EditOptions& edits = options.edits;
    if (!edits.file.empty() || !edits.kept.empty() || !edits.removed.empty())
        Zulm::requireEdits(edits, options.recording);
    if (!options.frames.empty())
        return;
    if (options.output.empty())
        throw CLI::RequiredError("either -o OUT or --frames DIR");
    if (options.isGif && options.fps > s_mostGifFps)
        throw CLI::ValidationError(fmt::format("--fps {}: a GIF has at most {} frames a second; players show more of "
                                               "them slower",
                                               *options.fps, s_mostGifFps));
    const std::string extension = options.isGif ? ".gif" : ".mp4";
    if (!options.output.ends_with(extension))
        throw CLI::ValidationError(
            fmt::format("{}: the name of the film must end in {}{}", options.output, extension,
                        options.output.ends_with(".gif") ? "; --gif makes an animated GIF" : ""));
}

} // namespace Render
