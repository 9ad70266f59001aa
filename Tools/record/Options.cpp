#include "Tools/record/Options.h"

#include "Tools/record/Failure.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>

#include <cstdio>
#include <map>
#include <memory>
#include <sstream>
#include <utility>

namespace Recorder {

namespace {

/// Reads "X,Y,WxH".
Area areaOf(const std::string& text) {
    Area area;
    int read = 0;
    const int count =
        std::sscanf(text.c_str(), "%9d,%9d,%9dx%9d%n", &area.x, &area.y, &area.width, &area.height, &read);
    if (count != 4 || static_cast<std::size_t>(read) != text.size() || area.width < 1 || area.height < 1)
        throw Refusal(fmt::format("--region {}: not of the form X,Y,WxH, such as 100,50,1280x720", text));
    return area;
}

/// The page of --help, as wide as a terminal.
class HelpPage final : public CLI::Formatter {
public:
    HelpPage() { column_width(s_descriptionColumn); }
    std::string make_option_desc(const CLI::Option* option) const override {
        return wrapped(option->get_description(), s_descriptionColumn);
    }
    std::string make_description(const CLI::App* app) const override {
        return wrapped(app->get_description(), 0) + "\n\n";
    }

private:
    static constexpr std::size_t s_descriptionColumn = 28;
    static constexpr std::size_t s_pageWidth = 80;

    /// Returns a text in lines that begin at this column; the formatter puts them there.
    static std::string wrapped(const std::string& text, std::size_t begin) {
        std::string lines;
        std::size_t column = begin;
        std::istringstream words(text);
        for (std::string word; words >> word; column += word.size()) {
            const bool fits = column + 1 + word.size() <= s_pageWidth;
            if (column > begin)
                lines += fits ? ' ' : '\n';
            column = fits ? column + 1 : begin;
            lines += word;
        }
        return lines;
    }
};

void requireOutput(const Options& options) {
    const std::string extension = options.output.extension().string();
    if (options.output.empty())
        throw Refusal("name the movie to make, as in 'zulm record -o OUT.mp4'");
    if (extension != ".mp4")
        throw Refusal(fmt::format("{}: the name of the movie must end in .mp4", options.output.string()));
}

void requireSense(const Options& options, const GivenOptions& given) {
    if (given.pause + given.resume + given.stop + (given.recover ? 1 : 0) > 1)
        throw Refusal("give one of --pause, --resume, --stop and --recover");
    if (options.deletesFolder && !given.recover)
        throw Refusal("--delete can only be given together with --recover");
    if (options.stopsOnClose && options.window.empty())
        throw Refusal("--stop-on-close can only be given together with --window");
    if (options.duration && !(*options.duration > 0 && *options.duration < 1e7))
        throw Refusal("--duration: not a number of seconds above 0");
    const int places = (options.region ? 1 : 0) + (options.window.empty() ? 0 : 1) + (options.monitor.empty() ? 0 : 1);
    if (places > 1)
        throw Refusal("give one of --region, --window and --monitor");
    if (options.task == Task::Record)
        requireOutput(options);
}

void addControl(CLI::App& app, GivenOptions& given) {
    app.add_flag("--pause", given.pause, "Pause the recorder that is running");
    app.add_flag("--resume", given.resume, "Let it go on");
    app.add_flag("--stop", given.stop, "End it, and wait until its movie is whole");
    app.add_option("--recover", given.recover, "Make a movie of what a recorder left that was killed")
        ->type_name("FOLDER");
    app.add_flag("--delete", given.options.deletesFolder,
                 "With --recover, remove the recorder's own files if the movie holds what they hold, and the folder if "
                 "nothing else is in it");
    app.add_option("--socket", given.socket,
                   "The socket by which the recorder is controlled, if several run; one in the user's runtime folder "
                   "unless it is given")
        ->type_name("FILE");
}

void addPlace(CLI::App& app, GivenOptions& given) {
    Options& options = given.options;
    app.add_option("--display", options.display, "The X display instead of $DISPLAY")->type_name("DISPLAY");
    app.add_option("--region", given.region, "Record this part of the screen, in pixels")->type_name("X,Y,WxH");
    app.add_option("--window", options.window,
                   "Record one window: its title or a part of it, its number, or 'click' to choose it by a click")
        ->type_name("WINDOW");
    app.add_option("--monitor", options.monitor, "Record one monitor, by its name in xrandr")->type_name("NAME");
    app.add_flag("--stop-on-close", options.stopsOnClose, "End when the window of --window is closed");
}

void addMovie(CLI::App& app, GivenOptions& given) {
    VideoSettings& video = given.options.video;
    app.add_option("--duration", given.duration, "End after this many seconds of recording")->type_name("SECONDS");
    app.add_option("--fps", video.fps, "Frames a second, from 1 to 60; 30 unless it is given")
        ->type_name("N")
        ->check(CLI::Range(1, 60).description(""));
    app.add_option("--codec", video.codec, "An encoder of libavcodec; h264 unless it is given")->type_name("NAME");
    app.add_option("--quality", video.quality,
                   "From 0, the best, to 51, if the encoder has such a scale, as that of h264; 20 "
                   "unless it is given")
        ->type_name("N")
        ->check(CLI::Range(0, 51).description(""));
    app.add_option("--audio", given.sound, "Record sound, from this source of PulseAudio or from the default one")
        ->type_name("[SOURCE]")
        ->expected(0, 1);
}

void addPrivacy(CLI::App& app, Options& options) {
    const auto numbered = [](std::string& word) {
        const std::map<std::string, KeyMode> modes{
            {"none", KeyMode::Nothing}, {"shortcuts", KeyMode::Shortcuts}, {"all", KeyMode::Everything}};
        const auto found = modes.find(word);
        if (found == modes.end())
            return fmt::format("'{}' is not none, shortcuts or all", word);
        word = std::to_string(static_cast<int>(found->second));
        return std::string();
    };
    app.add_option("--keys", options.keys,
                   "Which keys are recorded: none; shortcuts (unless it is given), which are keys that type no "
                   "character and keys with Ctrl, Alt or Super; or all. What is pressed in a password field, which the "
                   "accessibility bus tells apart, is left out, and so is everything in applications that tell it "
                   "nothing. Terminals show no password fields: if a terminal uses the bus, what is typed into it, "
                   "such as a password for sudo, is recorded like any other text")
        ->type_name("none|shortcuts|all")
        ->transform(CLI::Validator(numbered, ""));
    app.add_flag("--without-accessibility", options.withoutAccessibility,
                 "Do not ask the accessibility bus: with '--keys all', passwords are recorded too");
    app.add_option(
           "--deny-app", options.deniedApps,
           "Record no keys, titles and rectangles while a window is on top whose application matches this regular "
           "expression, regardless of the case of A to Z")
        ->type_name("PATTERN")
        ->expected(1)
        ->take_all();
    app.add_option("--deny-title", options.deniedTitles, "Do the same if the title of the window matches")
        ->type_name("PATTERN")
        ->expected(1)
        ->take_all();
}

/// Returns what was given, as the recorder uses it.
Options completed(GivenOptions& given, bool isWatcher) {
    Options options = std::move(given.options);
    if (isWatcher)
        options.task = Task::WatchAccessibility;
    else if (given.pause)
        options.task = Task::Pause;
    else if (given.resume)
        options.task = Task::Resume;
    else if (given.stop)
        options.task = Task::Stop;
    else if (given.recover)
        options.task = Task::Recover;
    options.output = given.output;
    options.folder = given.recover.value_or("");
    options.socket = given.socket;
    if (!given.region.empty())
        options.region = areaOf(given.region);
    options.duration = given.duration;
    options.sound = given.sound;
    options.video.hasSound = options.sound.has_value();
    requireSense(options, given);
    return options;
}

} // namespace

const char* const s_aboutRecording =
    "Record the screen of an X display: the picture, and as metadata the cursor, clicks, the wheel, keys, windows and "
    "the machine. Everything lies in the folder OUT.mp4.recording until OUT.mp4 is whole. Ctrl-C ends a recording";

const char* const s_recordingExamples = "zulm record -o Talk.mp4                      # until Ctrl-C\n"
                                        "zulm record -o Talk.mp4 --keys all --duration 60\n"
                                        "zulm record --stop                           # the one that is running\n"
                                        "zulm record --recover Talk.mp4.recording     # after the recorder was killed";

void addRecordingOptions(CLI::App& app, GivenOptions& given) {
    app.add_option("-o,--output", given.output, "The movie to make; it must not exist")->type_name("OUT");
    addMovie(app, given);
    addPlace(app, given);
    addPrivacy(app, given.options);
    app.add_flag("--json", given.options.json, "Print what was recorded as JSON");
    addControl(app, given);
}

std::optional<Options> optionsOf(int argc, char** argv) {
    CLI::App app(std::string(s_aboutRecording) + ".");
    app.name("zulm record");
    app.footer(std::string("Examples:\n") + s_recordingExamples);
    app.formatter(std::make_shared<HelpPage>());
    app.set_version_flag("--version", ZULM_VERSION);
    GivenOptions given;
    addRecordingOptions(app, given);
    bool isWatcher = false;
    app.add_flag("--watch-accessibility", isWatcher)->group("");
    try {
        app.parse(argc, argv);
    } catch (const CLI::Success& shown) {
        app.exit(shown);
        return std::nullopt;
    } catch (const CLI::ParseError& error) {
        throw Refusal(fmt::format("{}\n'zulm record --help' shows what can be given", error.what()));
    }
    return completed(given, isWatcher);
}

} // namespace Recorder
