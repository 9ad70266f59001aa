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

struct RepairOptions {
    SaveOptions save;
    bool dryRun = false;
    bool json = false;
};

struct Repair {
    RepairPlan plan;
    std::string output; ///< empty where nothing was written
};

RepairPlan planFor(const std::string& movie) {
    requireFile(movie);
    try {
        return SafeMovieSave(movie).plan();
    } catch (const SaveError& error) {
        throw Failure(error.what());
    }
}

Repair carryOut(const RepairOptions& options) {
    if (options.dryRun)
        return {planFor(options.save.movie), {}};
    SaveTarget movie(options.save, {});
    return {movie.save("repairing " + movie.name(), [](const SafeMovieSave& save) { return save.repair(); }),
            movie.name()};
}

void print(const RepairOptions& options, const Repair& repair) {
    const std::string& name = repair.output.empty() ? options.save.movie : repair.output;
    printRepair(name, repair.plan);
    if (repair.plan.state == RepairPlan::Whole)
        writeOutput(fmt::format("{}: nothing to repair\n", shown(name)));
    else if (repair.plan.state == RepairPlan::Repairable)
        writeOutput(fmt::format("{}: {}\n", shown(name),
                                options.dryRun ? "would be repaired; nothing was changed" : "repaired"));
}

Json fileDocument(const RepairOptions& options, const Repair& repair) {
    Json file = fileHeader(options.save.movie);
    file["output"] = nullptr;
    if (!repair.output.empty())
        addText(file, "output", repair.output);
    file.update(repairDocument(repair.plan));
    return file;
}

ExitCode repairMovie(const RepairOptions& options, RunReport& report) {
    const Repair repair = carryOut(options);
    if (report.isWanted())
        report.add(fileDocument(options, repair));
    else if (options.dryRun || !settings().quiet)
        print(options, repair);
    if (repair.plan.state == RepairPlan::Unrepairable) {
        complain(unrepairableText(options.save.movie, repair.plan));
        return ExitFailed;
    }
    const bool isStillDamaged = options.dryRun && repair.plan.state == RepairPlan::Repairable;
    return worseOf(complainAboutLoss(options.save.movie, repair.plan), isStillDamaged ? ExitDamaged : ExitFine);
}

} // namespace

void addRepairCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<RepairOptions>();
    CLI::App* command = app.add_subcommand("repair", "Mend a movie's last atom, or an append that was interrupted");
    addSaveOptions(*command, options->save);
    command
        ->add_flag("--dry-run", options->dryRun,
                   "Say what would change at which offset, and end with 3 where something would")
        ->excludes("--output")
        ->excludes("--in-place");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm repair --dry-run Recording.mp4\nzulm repair Recording.mp4 -o Repaired.mp4");
    command->callback([options, &chosen] {
        if (!options->dryRun)
            requireDestination(options->save);
        chosen = reporting("repair", options->json, {options->save.movie, options->save.output},
                           [options](RunReport& report) { return repairMovie(*options, report); });
    });
}

} // namespace Zulm
