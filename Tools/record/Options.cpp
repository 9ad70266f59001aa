#include "Tools/record/Options.h"

#include "Tools/record/Failure.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>

#include <cstdio>
#include <cstdlib>
#include <map>
#include <utility>

namespace Recorder {

namespace {

constexpr auto s_footer = R"(Everything lies in OUT.mp4.recording until OUT.mp4 is whole. Ctrl-C ends a recording well.

Keys: 'shortcuts' records keys that type no character, and keys with Ctrl, Alt or Super. 'all' records what is typed,
but not into password fields, which the accessibility bus tells apart. Terminals show no password fields: what is typed
into one, such as a password for sudo, is recorded like any other text.

  zulm record -o Talk.mp4 --duration 60
  zulm record --stop
  zulm record --recover Talk.mp4.recording)";

/// Reads "X,Y,WxH".
Area areaOf(const std::string& text) {
    Area area;
    int read = 0;
    const int count = std::sscanf(text.c_str(), "%d,%d,%dx%d%n", &area.x, &area.y, &area.width, &area.height, &read);
    if (count != 4 || static_cast<std::size_t>(read) != text.size() || area.width < 1 || area.height < 1)
        throw Refusal(fmt::format("--region {}: not of the form X,Y,WxH, such as 100,50,1280x720", text));
    return area;
}

void requireOutput(const Options& options) {
    const std::string extension = options.output.extension().string();
    if (options.output.empty())
        throw Refusal("name the movie to make, as in 'zulm record -o OUT.mp4'");
    if (extension != ".mp4")
        throw Refusal(fmt::format("{}: the name of the movie must end in .mp4", options.output.string()));
}

void requireSense(const Options& options, bool hasRecover) {
    if (options.task == Task::Record)
        requireOutput(options);
    if (options.deletesFolder && !hasRecover)
        throw Refusal("--delete can only be given together with --recover");
    if (options.stopsOnClose && options.window.empty())
        throw Refusal("--stop-on-close can only be given together with --window");
    if (options.duration && !(*options.duration > 0 && *options.duration < 1e7))
        throw Refusal("--duration: not a number of seconds above 0");
    const int places = (options.region ? 1 : 0) + (options.window.empty() ? 0 : 1) + (options.monitor.empty() ? 0 : 1);
    if (places > 1)
        throw Refusal("give one of --region, --window and --monitor");
}

} // namespace

std::optional<Options> optionsOf(int argc, char** argv) {
    Options options;
    CLI::App app("Record the screen of an X display, with the cursor, clicks, keys and windows as metadata");
    app.name("zulm record");
    app.footer(s_footer);
    std::string region;
    std::string output;
    std::string recover;
    std::string sound;
    std::string socket;
    double duration = 0;
    bool pause = false;
    bool resume = false;
    bool stop = false;
    bool watch = false;
    app.set_version_flag("--version", ZULM_VERSION);
    app.add_option("-o,--output", output, "The movie to make; it must not exist")->type_name("OUT.mp4");
    app.add_option("--display", options.display, "The X display instead of $DISPLAY");
    app.add_option("--region", region, "Record a part of the screen")->type_name("X,Y,WxH");
    app.add_option("--window", options.window, "Record one window: its title or a part of it, its number, or 'click'");
    app.add_option("--monitor", options.monitor, "Record one monitor, by its name in xrandr");
    app.add_flag("--stop-on-close", options.stopsOnClose, "End when the window of --window is closed");
    CLI::Option* durationOption = app.add_option("--duration", duration, "End after so many seconds of recording");
    app.add_option("--fps", options.video.fps, "Frames a second, 30 by default")->check(CLI::Range(1, 60));
    app.add_option("--codec", options.video.codec, "An encoder of libavcodec, h264 by default");
    app.add_option("--quality", options.video.quality, "From 0, the best, to 51; 20 by default")
        ->check(CLI::Range(0, 51));
    CLI::Option* soundOption =
        app.add_option("--audio", sound, "Record sound, from this source of PulseAudio or from the default one")
            ->expected(0, 1);
    const std::map<std::string, KeyMode> modes{
        {"none", KeyMode::Nothing}, {"shortcuts", KeyMode::Shortcuts}, {"all", KeyMode::Everything}};
    app.add_option("--keys", options.keys, "Which keys are recorded: none, shortcuts (default) or all")
        ->transform(CLI::CheckedTransformer(modes));
    app.add_flag("--without-accessibility", options.withoutAccessibility,
                 "Do not ask the accessibility bus: with '--keys all', passwords are recorded too");
    app.add_option("--deny-app", options.deniedApps, "No keys, titles and rectangles of applications that match")
        ->type_name("PATTERN")
        ->expected(1)
        ->take_all();
    app.add_option("--deny-title", options.deniedTitles, "The same for windows whose title matches")
        ->type_name("PATTERN")
        ->expected(1)
        ->take_all();
    app.add_flag("--json", options.json, "Print what was recorded as JSON");
    app.add_option("--socket", socket, "The socket by which the recorder is controlled");
    auto* commands = app.add_option_group("Control");
    commands->add_flag("--pause", pause, "Pause the recorder that is running");
    commands->add_flag("--resume", resume, "Let it go on");
    commands->add_flag("--stop", stop, "End it, and wait until its movie is whole");
    CLI::Option* recoverOption =
        commands->add_option("--recover", recover, "Make a movie of what a recorder left that was killed")
            ->type_name("FOLDER");
    commands->require_option(0, 1);
    app.add_flag("--delete", options.deletesFolder, "With --recover, remove the folder if the movie is whole");
    app.add_flag("--watch-accessibility", watch)->group("");
    try {
        app.parse(argc, argv);
    } catch (const CLI::Success& shown) {
        app.exit(shown);
        return std::nullopt;
    } catch (const CLI::ParseError& error) {
        throw Refusal(fmt::format("{}\n'zulm record --help' shows what can be given", error.what()));
    }
    if (watch)
        options.task = Task::WatchAccessibility;
    else if (pause)
        options.task = Task::Pause;
    else if (resume)
        options.task = Task::Resume;
    else if (stop)
        options.task = Task::Stop;
    else if (recoverOption->count() > 0)
        options.task = Task::Recover;
    options.output = output;
    options.folder = recover;
    options.socket = socket;
    if (!region.empty())
        options.region = areaOf(region);
    if (durationOption->count() > 0)
        options.duration = duration;
    if (soundOption->count() > 0)
        options.sound = sound;
    options.video.hasSound = options.sound.has_value();
    requireSense(options, recoverOption->count() > 0);
    return options;
}

} // namespace Recorder
