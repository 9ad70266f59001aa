#include "Reports/InfoReport.h"
#include "Reports/Text.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/SaveTarget.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct StampOptions {
    SaveOptions save;
    std::string creator;
    std::string version;
    SafeMovieSave::FragmentIndex index = SafeMovieSave::FragmentIndex::Leave;
    bool json = false;
};

void print(const StampOptions& options, const std::string& name, const StampResult& stamped) {
    const CreatorAttributes& creator = stamped.info.creator;
    printRepair(name, stamped.repair);
    writeOutput(fmt::format("{}: stamped as {}\n", shown(name), shownCreator(creator)));
    if (creator.name() != options.creator)
        writeOutput(fmt::format("  {} stands in place of {}: a movie stores the platform's name, not its creator's\n",
                                shown(creator.name()), shown(options.creator)));
}

Json fileDocument(const StampOptions& options, const std::string& name, const StampResult& stamped) {
    Json file = fileHeader(options.save.movie);
    addText(file, "output", name);
    file.update(Json{{"repair", repairDocument(stamped.repair)},
                     {"creator", creatorDocument(stamped.info.creator)},
                     {"fragment_index", fragmentIndexText(stamped.fragmentIndex)}});
    return file;
}

ExitCode complainAboutCut(const StampOptions& options, const CreatorAttributes& creator) {
    if (creator.version() == options.version)
        return ExitFine;
    complain(fmt::format("the version was cut to what its field holds: {}", creator.version()));
    return ExitDamaged;
}

ExitCode stampMovie(const StampOptions& options, RunReport& report) {
    SaveTarget movie(options.save, {});
    const StampResult stamped = movie.save("stamping " + movie.name(), [&](const SafeMovieSave& save) {
        return save.stamp(options.creator, options.version, options.index);
    });
    if (report.isWanted())
        report.add(fileDocument(options, movie.name(), stamped));
    else if (!settings().quiet)
        print(options, movie.name(), stamped);
    warnOfFragmentIndex(movie.name(), stamped.fragmentIndex);
    return worseOf(complainAboutLoss(movie.name(), stamped.repair), complainAboutCut(options, stamped.info.creator));
}

} // namespace

void addStampCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<StampOptions>();
    CLI::App* command =
        app.add_subcommand("stamp", "Append the recording info atom to a movie: a platform, a version, a system");
    addSaveOptions(*command, options->save);
    command
        ->add_option("--creator", options->creator,
                     "Who made the movie. This name is not stored: readers tell platforms apart by its field, so that "
                     "every stamp, on any system, stores the platform's name Mac in its place")
        ->required()
        ->type_name("NAME");
    command
        ->add_option("--creator-version", options->version,
                     "The version of the creator, at most 15 bytes; it is stored")
        ->required()
        ->type_name("V");
    addFragmentIndexOption(*command, options->index);
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm stamp Movie.mp4 --creator Recorder --creator-version 4.2 --in-place");
    command->callback([options, &chosen] {
        requireDestination(options->save);
        chosen = reporting("stamp", options->json, {options->save.movie, options->save.output},
                           [options](RunReport& report) { return stampMovie(*options, report); });
    });
}

} // namespace Zulm
