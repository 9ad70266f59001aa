#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"

#include <fmt/core.h>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct StampOptions {
    std::string movie;
    std::string creator;
    std::string version;
};

ExitCode runStamp(const StampOptions& options) {
    requireFile(options.movie, true);
    if (Recording(options.movie).parser().getStreamType() != MetaDataParser::QuickTime)
        throw Failure(fmt::format("{}: not a movie (.mp4, .mov, .zcap)", options.movie));
    if (!ZULMAtomRepair::finalizeAtomsInFile(options.movie))
        throw Failure(fmt::format("{}: its atoms do not fill the file, so nothing that is appended could be found",
                                  options.movie));
    ZULRAtomWriter().writeZULRtoFile(options.movie, options.creator, options.version);
    Recording stamped(options.movie);
    const auto infos = readRecordingInfo(stamped.parser());
    if (infos.empty() || !options.version.starts_with(infos.back().creator.version()))
        throw Failure(fmt::format("{}: the stamp cannot be found in it again", options.movie));
    const CreatorAttributes& creator = infos.back().creator;
    fmt::print("{}: stamped as {} {} on version {}\n", options.movie, creator.name(), creator.version(),
               creator.platformVersion());
    if (creator.version() != options.version)
        complain(fmt::format("the version was cut to what its field holds: {}", creator.version()));
    return ExitFine;
}

} // namespace

void addStampCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<StampOptions>();
    CLI::App* command = app.add_subcommand("stamp", "Append the recording info atom to a movie");
    command->add_option("MOVIE", options->movie, "The movie, which is changed")->required();
    command->add_option("--creator", options->creator, "Who made it (the platform's name is stored in its place)")
        ->required();
    command->add_option("--creator-version", options->version, "The version of who made it")->required();
    command->callback([options, &chosen] { chosen = [options] { return runStamp(*options); }; });
}

} // namespace Zulm
