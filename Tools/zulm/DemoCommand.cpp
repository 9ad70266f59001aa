#include "Tools/demo/Demo.h"
#include "Tools/demo/Movie.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaData/ZULMetaData.h"

#include <fmt/core.h>

#include <filesystem>
#include <memory>
#include <string_view>

namespace Zulm {

using namespace ZULMetaData;

namespace {

namespace fs = std::filesystem;

struct DemoOptions {
    std::string folder;
    std::string movie;
    bool force = false;
};

/// The movie to record around: a copy of the one that was named, or one made here.
std::string makeMovie(const DemoOptions& options) {
    const fs::path source(options.movie);
    const std::string name = "Recording" + (options.movie.empty() ? ".mp4" : source.extension().string());
    std::string path = (fs::path(options.folder) / name).string();
    if (options.movie.empty()) {
        writeWholeFile(path, Demo::stillMovie(), {}, options.force);
        return path;
    }
    OutputFile copy(path, {options.movie}, options.force);
    copy.copyFrom(options.movie);
    copy.commit();
    return path;
}

ExitCode runDemo(const DemoOptions& options) {
    if (!options.movie.empty()) {
        requireFile(options.movie);
        if (MetaDataParser::streamTypeOf(options.movie) != Container::QuickTime)
            throw Failure(fmt::format("{}: not a movie (.mp4, .mov, .zcap)", options.movie));
    }
    fs::create_directories(options.folder);
    const std::string movie = makeMovie(options);
    const auto print = [](std::string_view text) {
        if (!settings().quiet)
            writeOutput(text);
    };
    const bool allSame = Demo::runDemo(fs::path(options.folder) / "streams", movie, print);
    if (!allSame) {
        complain(fmt::format("{}: what was read back is not what was recorded", movie));
        return ExitDamaged;
    }
    print("Everything that was recorded has been read back.\n");
    return ExitFine;
}

} // namespace

void addDemoCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<DemoOptions>();
    CLI::App* command = app.add_subcommand(
        "demo", "Record a simulated session into a movie, read it back and check that it is the same");
    command->add_option("DIR", options->folder, "The folder for the movie and its stream files")->required();
    command->add_option("--movie", options->movie, "Record into a copy of this movie instead of a still picture")
        ->type_name("MOVIE");
    command->add_flag("--force", options->force, "Replace a recording that exists already");
    command->footer("zulm demo demo-output && zulm info demo-output/Recording.mp4");
    command->callback([options, &chosen] { chosen = [options] { return runDemo(*options); }; });
}

} // namespace Zulm
