#include "Reports/Findings.h"
#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/ManyFiles.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <functional>
#include <memory>
#include <set>
#include <stdexcept>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct VerifyOptions {
    ManyFiles files;
    std::set<FindingCode> ignored;
    bool isStrict = false;
    bool listsRules = false;
    bool json = false;
};

FindingCode ruleNamed(const std::string& name) {
    const auto found = std::find_if(s_findingRules.begin(), s_findingRules.end(),
                                    [&](const FindingRule& rule) { return rule.name == name; });
    if (found == s_findingRules.end())
        throw CLI::ValidationError("--ignore", fmt::format("{} is no rule{}; 'zulm verify --rules' lists them all",
                                                           name, suggestionFor(name, namesIn(s_findingRules))));
    return found->code;
}

ExitCode listRules() {
    for (const FindingRule& rule : s_findingRules)
        writeOutput(fmt::format("{:<23}  {:<7}  {}\n", rule.name, severityText(rule.severity), rule.meaning));
    return ExitFine;
}

/// Nothing else may open the file first: it is not known to be safe.
ValidationReport validate(const InputFile& input, const std::set<FindingCode>& ignored) {
    try {
        return validateRecording(input.path(), ignored);
    } catch (const std::runtime_error& error) {
        throw Failure(fmt::format("{}: {}", input.name(), error.what()));
    }
}

bool isFine(const ValidationReport& report, bool isStrict) {
    return !report.isDamaged() && !(isStrict && report.noticeCount > 0);
}

ExitCode exitCodeFor(const ValidationReport& report, bool isStrict) {
    if (!isFine(report, isStrict))
        return ExitDamaged;
    return report.hasMetaData() ? ExitFine : ExitNoMetaData;
}

std::string counted(std::uint64_t count, const char* one, const char* many) {
    return fmt::format("{} {}", count, count == 1 ? one : many);
}

void print(const std::string& name, const ValidationReport& report, bool isStrict) {
    const auto findings = report.allFindings();
    for (const Finding& finding : findings)
        writeOutput(fmt::format("{}: {}\n", shown(name), findingText(finding)));
    if (const std::uint64_t unlisted = report.damageCount + report.noticeCount - findings.size(); unlisted > 0)
        writeOutput(
            fmt::format("{}: {} not listed\n", shown(name), counted(unlisted, "more finding is", "more findings are")));
    if (settings().quiet)
        return;
    if (isFine(report, isStrict) && report.hasMetaData())
        writeOutput(fmt::format("{}: ok ({}, {})\n", shown(name), counted(report.streamCount, "stream", "streams"),
                                counted(report.wholeEntries, "entry", "entries")));
    else if (isFine(report, isStrict))
        writeOutput(fmt::format("{}: no recording metadata\n", shown(name)));
}

/// What to run next.
void advise(const std::string& name, const ValidationReport& report) {
    const auto isOpenEnded = [](const Finding& finding) { return finding.code == FindingCode::OpenEndedAtom; };
    if (std::any_of(report.findings.begin(), report.findings.end(), isOpenEnded))
        warn(fmt::format("{}: 'zulm repair --dry-run {}' says whether its last atom can be closed", name,
                         shellWord(name)));
    if (!std::all_of(report.streams.begin(), report.streams.end(), std::mem_fn(&StreamReport::isReachable)))
        warn(fmt::format("{}: 'zulm salvage {} -o DIR' writes out the streams that no reader finds", name,
                         shellWord(name)));
}

ExitCode verify(const VerifyOptions& options, const std::string& path, RunReport& report) {
    const InputFile input(path);
    const ValidationReport found = validate(input, options.ignored);
    if (report.isWanted())
        report.add(verifyDocument(input.name(), found));
    else
        print(input.name(), found, options.isStrict);
    advise(input.name(), found);
    const ExitCode code = exitCodeFor(found, options.isStrict);
    if (code == ExitNoMetaData)
        report.note(path, "has no recording metadata");
    return code;
}

} // namespace

void addVerifyCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<VerifyOptions>();
    CLI::App* command = app.add_subcommand("verify", "Walk every byte of the metadata and say what is damaged where");
    addManyFiles(*command, options->files, "Movies, RIFF files or stream files; - is standard input");
    command->add_flag("--strict", options->isStrict, "End with 3 if there are notices, too");
    command
        ->add_option_function<std::vector<std::string>>(
            "--ignore",
            [options](const std::vector<std::string>& names) {
                for (const std::string& name : names)
                    options->ignored.insert(ruleNamed(name));
            },
            "Neither report nor count what this rule finds (repeatable); --rules lists the rules")
        ->type_name("RULE")
        ->allow_extra_args(false);
    command->add_flag("--rules", options->listsRules, "List every rule with its severity and its meaning, and end");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm verify Recording.mp4\nzulm verify --json *.mp4\n"
                    "zulm verify --strict --ignore several-metadata-atoms Recording.mp4\n"
                    "find Recordings -name '*.mp4' -print0 | zulm -q verify --files-from - --null --jobs 0");
    command->callback([options, &chosen] {
        if (options->listsRules) {
            chosen = listRules;
            return;
        }
        requireFiles(options->files);
        chosen = reportingOnMany("verify", options->json, options->files, [options](RunReport& report) {
            return workOnFiles(options->files, report, [options](const std::string& path, RunReport& part) {
                return verify(*options, path, part);
            });
        });
    });
}

} // namespace Zulm
