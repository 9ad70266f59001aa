#include "Tools/zulm/Command.h"
#include "Tools/zulm/Findings.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/VerifyReport.h"

#include <fmt/core.h>

#include <algorithm>
#include <functional>
#include <memory>
#include <stdexcept>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct VerifyOptions {
    std::vector<std::string> files;
    bool json = false;
};

/// Nothing else may open the file first: it is not known to be safe.
ValidationReport validate(const InputFile& input) {
    try {
        return validateRecording(input.path());
    } catch (const std::runtime_error& error) {
        throw Failure(fmt::format("{}: {}", input.name(), error.what()));
    }
}

ExitCode exitCodeFor(const ValidationReport& report) {
    if (report.isDamaged())
        return ExitDamaged;
    return report.hasMetaData() ? ExitFine : ExitNoMetaData;
}

std::string counted(std::uint64_t count, const char* one, const char* many) {
    return fmt::format("{} {}", count, count == 1 ? one : many);
}

void print(const std::string& name, const ValidationReport& report) {
    const auto findings = report.allFindings();
    for (const Finding& finding : findings)
        writeOutput(fmt::format("{}: {}\n", shown(name), findingText(finding)));
    if (const std::uint64_t unlisted = report.damageCount + report.noticeCount - findings.size(); unlisted > 0)
        writeOutput(
            fmt::format("{}: {} not listed\n", shown(name), counted(unlisted, "more finding is", "more findings are")));
    if (!report.isDamaged() && report.hasMetaData())
        writeOutput(fmt::format("{}: ok ({}, {})\n", shown(name), counted(report.streamCount, "stream", "streams"),
                                counted(report.wholeEntries, "entry", "entries")));
    else if (!report.isDamaged())
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

ExitCode runVerify(const VerifyOptions& options) {
    Json files = Json::array();
    const ExitCode code = forEachFile(options.files, [&](const std::string& path) {
        const InputFile input(path);
        const ValidationReport report = validate(input);
        if (options.json)
            files.push_back(verifyDocument(input.name(), report));
        else
            print(input.name(), report);
        advise(input.name(), report);
        return exitCodeFor(report);
    });
    if (options.json)
        printReport("verify", std::move(files));
    return code;
}

} // namespace

void addVerifyCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<VerifyOptions>();
    CLI::App* command = app.add_subcommand("verify", "Walk every byte of the metadata and say what is damaged where");
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files; - is standard input")->required();
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm verify Recording.mp4\nzulm verify --json *.mp4");
    command->callback([options, &chosen] { chosen = [options] { return runVerify(*options); }; });
}

} // namespace Zulm
